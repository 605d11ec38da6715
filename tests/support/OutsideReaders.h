// What programs of others say about a movie file. A program that fails is a failed check, with what it printed.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace TestSupport
{

// All that ffprobe tells of format and streams, frames counted: "streams.stream.0.width" and so on, texts without quotes. Anything on its
// standard error but the text given here, a warning included, is a failed check.
std::map<std::string, std::string> AskFFprobe( const std::string& i_rPath, const std::string& i_rErrorText = {} );

// The frames of the first video stream as ffmpeg decodes them, in one of its pixel formats, and the samples of the first audio stream, in one
// of its raw formats ("s16le").
std::vector<uint8_t> DecodeVideo( const std::string& i_rPath, const std::string& i_rPixelFormat );
std::vector<uint8_t> DecodeAudio( const std::string& i_rPath, const std::string& i_rSampleFormat );

// "mediainfo --Output=..." of a template such as "Video;%FrameCount%".
std::string AskMediaInfo( const std::string& i_rPath, const std::string& i_rTemplate );

}
