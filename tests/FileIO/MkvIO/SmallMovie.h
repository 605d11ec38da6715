// A recording of a few bytes, written into memory: 4 x 1 grey pixels and two channels of 16-bit sound.
#pragma once

#include "FileIO/MkvIO/MkvWriter.h"
#include "tests/support/FailingStream.h"
#include "tests/support/MemoryFile.h"

#include <memory>
#include <string>
#include <vector>

namespace MkvIO
{

using VBytes = std::vector<uint8_t>;

inline std::shared_ptr<const KVZ::IBufferConst> Buffer( const VBytes& i_rBytes )
{
  auto pBuffer = std::make_shared<KVZ::IStandardBuffer>();
  pBuffer->Bytes().assign( i_rBytes.begin(), i_rBytes.end() );
  return pBuffer;
}

inline VBytes Text( const std::string& i_rText ) { return { i_rText.begin(), i_rText.end() }; }

inline KVZ::VideoFrameInfo VideoInfo( KVZ::IPixelFormat::Enum i_Format = KVZ::IPixelFormat::ELuminance8, uint32_t i_Width = 4, uint32_t i_Height = 1 )
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = i_Width;
  Info.m_ImageHeight = i_Height;
  Info.m_PixelFormat = i_Format;
  Info.m_PixelAspectRatio = 1.0;
  Info.m_InterlacedFormat = KVZ::IInterlacedFormat::ENotInterlaced;
  return Info;
}

constexpr KVZ::AudioFrameInfo SmallAudio{ KVZ::IAudioSampleFormat::EInt16, 48000, 2 };
constexpr KVZ::VTimingRecord Timing2997{ 135000000, 4504500, 0 };

// What a header is given besides the writer's own defaults here.
struct VDescription
{
  KVZ::VideoFrameInfo m_Video = VideoInfo();
  KVZ::AudioFrameInfo m_Audio = SmallAudio;
  KVZ::VTimingRecord m_Timing = Timing2997;
  KVZ::ITimecode m_Timecode{};
  KVZ::IVideoAttributes m_Attributes{};
  KVZ::IVideoPayload::Enum m_Payload = KVZ::IVideoPayload::EUncompressed;

  bool WriteHeader( KVZ::IVideoWriter& io_rWriter ) const
  {
    const auto AudioPayload = m_Audio.IsEmpty() ? KVZ::IAudioPayload::ENone : KVZ::IAudioPayload::EUncompressed;
    return io_rWriter.WriteHeader( m_Video, m_Audio, m_Timing, m_Timecode, {}, m_Attributes, m_Payload, AudioPayload );
  }
};

// A writer into memory.
struct VSmallMovie
{
  explicit VSmallMovie( const TestSupport::VFault& i_rFault = {} )
    : m_Writer( {},
        [this, i_rFault]( const std::string& )
        {
          m_pBytes->clear();
          return std::make_unique<TestSupport::VFailingStream>( std::make_unique<TestSupport::VMemoryFile>( m_pBytes ), i_rFault, &m_Operations );
        } )
  {
  }

  bool Begin( const VDescription& i_rDescription = {} ) { return m_Writer.Open( "memory" ) && i_rDescription.WriteHeader( m_Writer ); }

  bool WriteFrame( const std::string& i_rVideo, const std::string& i_rAudio, uint64_t i_Key = VMkvWriter::AppendKey )
  {
    return m_Writer.WriteFrame( KVZ::VFrameSet{ Buffer( Text( i_rVideo ) ), VideoInfo(), { Buffer( Text( i_rAudio ) ) }, SmallAudio }, i_Key );
  }

  std::shared_ptr<VBytes> m_pBytes = std::make_shared<VBytes>();
  uint64_t m_Operations = 0;
  VMkvWriter m_Writer;
};

}
