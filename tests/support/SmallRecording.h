// What the tests of all containers write: what a writer is told of its frames, and a writer into memory.
#pragma once

#include "FileIO/WriterSupport/WatchedStream.h"
#include "tests/support/FailingStream.h"
#include "tests/support/MemoryFile.h"
#include "tests/support/TestFrames.h"

#include <optional>

namespace TestSupport
{

constexpr uint64_t AppendKey = ~uint64_t{ 0 };

// What a writer is told before the first frame.
struct VHeader
{
  KVZ::VideoFrameInfo m_Video = VideoInfo( KVZ::IPixelFormat::EU8Y8V8Y8, 4, 2 );
  KVZ::AudioFrameInfo m_Audio = MonoAudio;
  KVZ::VTimingRecord m_Timing = Rate25;
  KVZ::ITimecode m_Timecode{};
  KVZ::VColourRecord m_Colour{};
  KVZ::IVideoAttributes m_Attributes{};
  KVZ::IVideoPayload::Enum m_Payload = KVZ::IVideoPayload::EUncompressed;
  std::optional<KVZ::IAudioPayload::Enum> m_AudioPayload{};   // otherwise uncompressed where there is sound

  size_t ImageBytes() const { return KVZ::GetImageSize( m_Video.m_PixelFormat, m_Video.m_ImageWidth, m_Video.m_ImageHeight ); }
  size_t SampleBytes() const { return m_Audio.m_Channels * KVZ::GetBytesPerSample( m_Audio.m_SampleFormat ); }   // of all channels

  bool WriteTo( KVZ::IVideoWriter& io_rWriter ) const
  {
    const auto AudioPayload = m_AudioPayload.value_or( m_Audio.IsEmpty() ? KVZ::IAudioPayload::ENone : KVZ::IAudioPayload::EUncompressed );
    return io_rWriter.WriteHeader( m_Video, m_Audio, m_Timing, m_Timecode, m_Colour, m_Attributes, m_Payload, AudioPayload );
  }

  bool WriteFrame( KVZ::IVideoWriter& io_rWriter, const VBytes& i_rVideo, const VBytes& i_rAudio = {}, uint64_t i_Key = AppendKey ) const
  {
    return io_rWriter.WriteFrame( KVZ::VFrameSet{ Buffer( i_rVideo ), m_Video, { Buffer( i_rAudio ) }, m_Audio }, i_Key );
  }
};

// A writer into memory. i_Make gives it for a maker of streams.
template<class TWriter>
struct VMemoryRecording
{
  template<class TMake>
  VMemoryRecording( VHeader i_Header, const VFault& i_rFault, TMake i_Make )
    : m_Header( std::move( i_Header ) ), m_Writer( i_Make( StreamMaker( i_rFault ) ) )
  {
  }

  bool Begin() { return m_Writer.Open( "memory" ) && m_Header.WriteTo( m_Writer ); }
  bool Frame( const VBytes& i_rVideo, const VBytes& i_rAudio = {}, uint64_t i_Key = AppendKey )
  {
    return m_Header.WriteFrame( m_Writer, i_rVideo, i_rAudio, i_Key );
  }

  WriterSupport::VStreamMaker StreamMaker( const VFault& i_rFault )
  {
    return [this, i_rFault]( const std::string& )
    {
      m_pBytes->clear();
      return std::make_unique<VFailingStream>( std::make_unique<VMemoryFile>( m_pBytes ), i_rFault );
    };
  }

  VHeader m_Header;
  const std::shared_ptr<VBytes> m_pBytes = std::make_shared<VBytes>();
  TWriter m_Writer;
};

}
