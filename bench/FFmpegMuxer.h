// A file written by a muxer of FFmpeg's library, for comparison: uncompressed 4:2:2 video alone, 25 frames a second. Nothing is copied on the
// way to the muxer and nothing interleaved.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

struct VFFmpegVideo
{
  std::string m_Muxer;   // by the library's name for it
  std::string m_Tag;     // four characters for the pixels; empty: the muxer's own
  int m_Width = 0;
  int m_Height = 0;
};

class VFFmpegMuxer
{
public:
  // Whether this build has the library.
  static bool IsAvailable();

  // With the header written. Throws std::runtime_error, as all that follows.
  VFFmpegMuxer( const std::string& i_rPath, const VFFmpegVideo& i_rVideo );
  ~VFFmpegMuxer();
  VFFmpegMuxer( const VFFmpegMuxer& ) = delete;
  VFFmpegMuxer& operator=( const VFFmpegMuxer& ) = delete;

  void Write( const uint8_t* i_pImage, size_t i_Size );
  // Writes what belongs at the end.
  void Close();

private:
  class VImpl;
  const std::unique_ptr<VImpl> m_pImpl;
};
