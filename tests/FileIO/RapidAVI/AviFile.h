// Recordings of a few bytes, written into memory or to a file.
#pragma once

#include "FileIO/RapidAVI/Writer.h"
#include "tests/support/FailingStream.h"
#include "tests/support/MemoryFile.h"
#include "tests/support/RiffParser.h"

#include <memory>
#include <random>
#include <string>
#include <vector>

namespace RapidAVI
{

using VBytes = std::vector<uint8_t>;

inline std::shared_ptr<const KVZ::IBufferConst> Buffer( const VBytes& i_rBytes )
{
  auto pBuffer = std::make_shared<KVZ::IStandardBuffer>();
  pBuffer->Bytes() = i_rBytes;
  return pBuffer;
}

// The same bytes for the same number.
inline VBytes Noise( size_t i_Size, uint32_t i_Number )
{
  std::minstd_rand Random( i_Number + 1 );
  VBytes Bytes( i_Size );
  for( uint8_t& rByte : Bytes )
  {
    rByte = static_cast<uint8_t>( Random() >> 8 );
  }
  return Bytes;
}

inline KVZ::VideoFrameInfo Video( KVZ::IPixelFormat::Enum i_Format, uint32_t i_Width, uint32_t i_Height )
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = i_Width;
  Info.m_ImageHeight = i_Height;
  Info.m_PixelFormat = i_Format;
  Info.m_PixelAspectRatio = 1.0;
  Info.m_InterlacedFormat = KVZ::IInterlacedFormat::ENotInterlaced;
  return Info;
}

constexpr KVZ::AudioFrameInfo MonoAudio{ KVZ::IAudioSampleFormat::EInt16, 48000, 1 };
constexpr KVZ::VTimingRecord Rate25{ 135000000, 5400000, 0 };

struct VSettings
{
  KVZ::VideoFrameInfo m_Video = Video( KVZ::IPixelFormat::EU8Y8V8Y8, 4, 1 );
  KVZ::AudioFrameInfo m_Audio = MonoAudio;
  KVZ::VTimingRecord m_Timing = Rate25;
  KVZ::IVideoAttributes m_Attributes{};
  KVZ::ITimecode m_Timecode{};
  KVZ::IVideoPayload::Enum m_Payload = KVZ::IVideoPayload::EUncompressed;

  bool WriteHeader( KVZ::IVideoWriter& io_rWriter ) const
  {
    const auto AudioPayload = m_Audio.IsEmpty() ? KVZ::IAudioPayload::ENone : KVZ::IAudioPayload::EUncompressed;
    return io_rWriter.WriteHeader( m_Video, m_Audio, m_Timing, m_Timecode, {}, m_Attributes, m_Payload, AudioPayload );
  }

  bool WriteFrame( KVZ::IVideoWriter& io_rWriter, uint64_t i_Key, const VBytes& i_rVideo, const VBytes& i_rAudio ) const
  {
    return io_rWriter.WriteFrame( KVZ::VFrameSet{ Buffer( i_rVideo ), m_Video, { Buffer( i_rAudio ) }, m_Audio }, i_Key );
  }
};

// A writer into memory.
struct VAviFile
{
  explicit VAviFile( const VSettings& i_rSettings = {}, const VSegmentLimits& i_rLimits = {}, const TestSupport::VFault& i_rFault = {},
    std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {} )
    : m_Settings( i_rSettings ),
      m_Writer(
        std::move( i_pEncoder ),
        [this, i_rFault]( const std::string& )
        {
          m_pBytes->clear();
          return std::make_unique<TestSupport::VFailingStream>( std::make_unique<TestSupport::VMemoryFile>( m_pBytes ), i_rFault, &m_Operations );
        },
        i_rLimits )
  {
  }

  bool OpenAndWriteHeader() { return m_Writer.Open( "memory" ) && m_Settings.WriteHeader( m_Writer ); }
  bool WriteFrame( uint64_t i_Key, const VBytes& i_rVideo, const VBytes& i_rAudio )
  {
    return m_Settings.WriteFrame( m_Writer, i_Key, i_rVideo, i_rAudio );
  }
  TestSupport::VAviParser Parse() const { return TestSupport::VAviParser( *m_pBytes ); }

  const VSettings m_Settings;
  std::shared_ptr<VBytes> m_pBytes = std::make_shared<VBytes>();
  uint64_t m_Operations = 0;
  VRapidAVIWriter m_Writer;
};

}
