#include "tests/support/OutsideReaders.h"

#include "tests/support/ProgramRun.h"

#include <gtest/gtest.h>

#include <sstream>

namespace TestSupport
{

namespace
{

// Its standard output.
std::string Ask( const std::vector<std::string>& i_rArguments, const std::string& i_rErrorText = {} )
{
  const VRunResult Run = RunProgram( i_rArguments );
  EXPECT_EQ( Run.m_ExitCode, 0 ) << i_rArguments.front() << ": " << Run.m_Error << Run.m_Output;
  EXPECT_EQ( Run.m_Error, i_rErrorText ) << i_rArguments.front();
  return Run.m_Output;
}

std::vector<uint8_t> Decode( const std::string& i_rPath, const std::vector<std::string>& i_rOptions )
{
  std::vector<std::string> Arguments = { "ffmpeg", "-nostdin", "-v", "error", "-i", i_rPath };
  Arguments.insert( Arguments.end(), i_rOptions.begin(), i_rOptions.end() );
  Arguments.push_back( "-" );
  const std::string Bytes = Ask( Arguments );
  return { Bytes.begin(), Bytes.end() };
}

std::string WithoutQuotes( const std::string& i_rText )
{
  return i_rText.size() >= 2 && i_rText.front() == '"' ? i_rText.substr( 1, i_rText.size() - 2 ) : i_rText;
}

}

std::map<std::string, std::string> AskFFprobe( const std::string& i_rPath, const std::string& i_rErrorText )
{
  std::istringstream Lines(
    Ask( { "ffprobe", "-v", "warning", "-show_format", "-show_streams", "-count_frames", "-of", "flat", i_rPath }, i_rErrorText ) );
  std::map<std::string, std::string> Answers;
  for( std::string Line; std::getline( Lines, Line ); )
  {
    const size_t Equals = Line.find( '=' );
    Answers[Line.substr( 0, Equals )] = WithoutQuotes( Line.substr( Equals + 1 ) );
  }
  return Answers;
}

// Each packet as it lies in the file: no frame is repeated or left out for the sake of a constant rate.
std::vector<uint8_t> DecodeVideo( const std::string& i_rPath, const std::string& i_rPixelFormat )
{
  return Decode( i_rPath, { "-map", "0:v:0", "-fps_mode", "passthrough", "-pix_fmt", i_rPixelFormat, "-f", "rawvideo" } );
}

std::vector<uint8_t> DecodeAudio( const std::string& i_rPath, const std::string& i_rSampleFormat )
{
  return Decode( i_rPath, { "-map", "0:a:0", "-f", i_rSampleFormat } );
}

std::string AskMediaInfo( const std::string& i_rPath, const std::string& i_rTemplate )
{
  const std::string Text = Ask( { "mediainfo", "--Output=" + i_rTemplate, i_rPath } );
  return Text.substr( 0, Text.find( '\n' ) );
}

}
