// A movie of a few bytes, written into memory: 4 x 2 pixels of 4:2:2, one channel of 16-bit sound, 25 frames a second.
#pragma once

#include "FileIO/MovIO/MovWriter.h"
#include "tests/support/FailingStream.h"
#include "tests/support/MemoryFile.h"
#include "tests/support/MovParser.h"

#include <memory>
#include <string>
#include <vector>

namespace MovIO
{

using VBytes = std::vector<uint8_t>;

inline VBytes Bytes( const std::string& i_rText ) { return { i_rText.begin(), i_rText.end() }; }

inline std::shared_ptr<const KVZ::IBufferConst> Buffer( const VBytes& i_rBytes )
{
  auto pBuffer = std::make_shared<KVZ::IStandardBuffer>();
  pBuffer->Bytes() = i_rBytes;
  return pBuffer;
}

inline KVZ::VideoFrameInfo VideoInfo( uint32_t i_Width, uint32_t i_Height, KVZ::IPixelFormat::Enum i_Format )
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = i_Width;
  Info.m_ImageHeight = i_Height;
  Info.m_PixelFormat = i_Format;
  Info.m_PixelAspectRatio = 1.0;
  Info.m_InterlacedFormat = KVZ::IInterlacedFormat::ENotInterlaced;
  return Info;
}

// What goes into the header of a writer.
struct VMovieSettings
{
  KVZ::IVideoContainer::Enum m_Container = KVZ::IVideoContainer::EMOV;
  KVZ::VideoFrameInfo m_Video = VideoInfo( 4, 2, KVZ::IPixelFormat::EU8Y8V8Y8 );
  KVZ::AudioFrameInfo m_Audio{ KVZ::IAudioSampleFormat::EInt16, 48000, 1 };
  KVZ::VTimingRecord m_Timing{ 135000000, 5400000, 0 };
  KVZ::ITimecode m_Timecode{ KVZ::ITimecodeStandard::ETimecode25, 1 };
  KVZ::VColourRecord m_Colour{};
  KVZ::IVideoAttributes m_Attributes{};
  KVZ::IVideoPayload::Enum m_VideoPayload = KVZ::IVideoPayload::EUncompressed;
  KVZ::IAudioPayload::Enum m_AudioPayload = KVZ::IAudioPayload::EUncompressed;

  static VMovieSettings Silent()
  {
    VMovieSettings Settings;
    Settings.m_Audio = {};
    Settings.m_AudioPayload = KVZ::IAudioPayload::ENone;
    return Settings;
  }
};

inline bool WriteHeader( KVZ::IVideoWriter& o_rWriter, const VMovieSettings& i_rSettings )
{
  return o_rWriter.WriteHeader( i_rSettings.m_Video, i_rSettings.m_Audio, i_rSettings.m_Timing, i_rSettings.m_Timecode, i_rSettings.m_Colour,
    i_rSettings.m_Attributes, i_rSettings.m_VideoPayload, i_rSettings.m_AudioPayload );
}

// The next frame of such a file.
inline bool AppendFrame( KVZ::IVideoWriter& o_rWriter, const VMovieSettings& i_rSettings, const VBytes& i_rVideo, const VBytes& i_rAudio = {} )
{
  return o_rWriter.WriteFrame( KVZ::VFrameSet{ Buffer( i_rVideo ), i_rSettings.m_Video, { Buffer( i_rAudio ) }, i_rSettings.m_Audio },
    VMovWriter::AppendKey );
}

struct VSmallMovie
{
  explicit VSmallMovie( VMovieSettings i_Settings = {}, const TestSupport::VFault& i_rFault = {},
    std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {} )
    : m_Settings( std::move( i_Settings ) ),
      m_Writer( m_Settings.m_Container, std::move( i_pEncoder ),
        [this, i_rFault]( const std::string& )
        { return std::make_unique<TestSupport::VFailingStream>( std::make_unique<TestSupport::VMemoryFile>( m_pBytes ), i_rFault, &m_Operations ); } )
  {
  }

  bool Start() { return m_Writer.Open( "memory" ) && WriteHeader( m_Writer, m_Settings ); }
  bool Frame( const VBytes& i_rVideo, const VBytes& i_rAudio = {} ) { return AppendFrame( m_Writer, m_Settings, i_rVideo, i_rAudio ); }
  TestSupport::VMovParser Parse() const { return TestSupport::VMovParser::OfBytes( *m_pBytes ); }

  const VMovieSettings m_Settings;
  const std::shared_ptr<VBytes> m_pBytes = std::make_shared<VBytes>();
  uint64_t m_Operations = 0;
  VMovWriter m_Writer;
};

}
