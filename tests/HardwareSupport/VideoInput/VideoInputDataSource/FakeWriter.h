// A writer that keeps what it is given, insists on the order of the calls, and fails at the call that a test names.
#pragma once

#include "Core/VideoInterface/VideoWriter.h"

#include <cstdint>
#include <limits>
#include <map>
#include <memory>
#include <new>
#include <string>
#include <vector>

struct VFakeFile
{
  static constexpr uint64_t Never = std::numeric_limits<uint64_t>::max();

  uint64_t m_FailingCall = Never;   // 0 opens, 1 writes the header, 2 the first frame and so on
  bool m_bThrows = false;           // and that call throws: memory runs out around the writer
  bool m_bCloseFails = false;
  uint64_t m_IncompleteFrames = 0;   // as the writer counts them

  bool m_bOpen = false;
  int m_Closes = 0;
  bool m_bHeaded = false;
  KVZ::VideoFrameInfo m_Video;
  KVZ::AudioFrameInfo m_Audio;
  KVZ::VTimingRecord m_Timing;
  KVZ::ITimecode m_Timecode;
  KVZ::IVideoPayload::Enum m_VideoPayload{};
  KVZ::IAudioPayload::Enum m_AudioPayload{};
  std::string m_CaptureName;
  KVZ::VCameraHardwareRecord m_Camera;
  std::vector<KVZ::VConversionRecord> m_Conversion;
  std::vector<std::vector<uint8_t>> m_Frames;
  std::vector<std::vector<uint8_t>> m_Sound;
  std::vector<uint64_t> m_Keys;
  std::vector<const uint8_t*> m_Addresses;   // of the frames' bytes as they were given
};

// What lies on the disk, by path.
using VFakeDisk = std::map<std::string, VFakeFile>;

class VFakeWriter : public KVZ::IVideoWriter
{
public:
  explicit VFakeWriter( std::shared_ptr<VFakeDisk> i_pDisk ) : m_pDisk( std::move( i_pDisk ) ) {}

  const KVZ::IVideoWriterCapabilities& GetCapabilities() const override { return KVZ::GetVideoWriterCapabilities( KVZ::IVideoContainer::ETVID ); }
  bool Open( const std::string& i_rPath ) override
  {
    m_pFile = &( *m_pDisk )[i_rPath];
    m_pFile->m_bOpen = Succeeds();
    return m_pFile->m_bOpen;
  }
  bool IsOpen() const override { return m_pFile && m_pFile->m_bOpen; }
  bool WriteHeader( const KVZ::VideoFrameInfo& i_rVideoInfo, const KVZ::AudioFrameInfo& i_rAudioInfo, const KVZ::VTimingRecord& i_rTiming,
    const KVZ::ITimecode& i_rTimecode, const KVZ::VColourRecord&, const KVZ::IVideoAttributes& i_rAttributes, KVZ::IVideoPayload::Enum i_VideoPayload,
    KVZ::IAudioPayload::Enum i_AudioPayload ) override
  {
    m_pFile->m_Video = i_rVideoInfo;
    m_pFile->m_Audio = i_rAudioInfo;
    m_pFile->m_Timing = i_rTiming;
    m_pFile->m_Timecode = i_rTimecode;
    m_pFile->m_VideoPayload = i_VideoPayload;
    m_pFile->m_AudioPayload = i_AudioPayload;
    i_rAttributes.Get( "Capture.Name", m_pFile->m_CaptureName );
    m_pFile->m_Camera.ReadAttributes( i_rAttributes );
    KVZ::ReadAttributes( m_pFile->m_Conversion, i_rAttributes );
    m_pFile->m_bHeaded = IsOpen() && !m_pFile->m_bHeaded && Succeeds();
    return m_pFile->m_bHeaded;
  }
  bool WriteFrame( const KVZ::VFrameSet&, uint64_t ) override { return false; }
  bool WriteFrame( KVZ::VBufferList& io_rVideo, const KVZ::VideoFrameInfo&, KVZ::VBufferList& io_rAudio, const KVZ::AudioFrameInfo&,
    uint64_t i_FrameKey ) override
  {
    if( !IsOpen() || !m_pFile->m_bHeaded || !Succeeds() )
    {
      return false;
    }
    m_pFile->m_Addresses.push_back( io_rVideo.front()->Data() );
    m_pFile->m_Frames.push_back( BytesOf( io_rVideo ) );
    m_pFile->m_Sound.push_back( BytesOf( io_rAudio ) );
    m_pFile->m_Keys.push_back( i_FrameKey );
    return true;
  }
  bool Close() override
  {
    m_pFile->m_bOpen = false;
    ++m_pFile->m_Closes;
    return !m_pFile->m_bCloseFails;
  }
  uint64_t CountIncompleteFrames() const override { return m_pFile->m_IncompleteFrames; }

private:
  bool Succeeds()
  {
    const bool bSucceeds = m_Calls++ != m_pFile->m_FailingCall;
    if( !bSucceeds && m_pFile->m_bThrows )
    {
      throw std::bad_alloc();
    }
    return bSucceeds;
  }
  static std::vector<uint8_t> BytesOf( const KVZ::VBufferList& i_rBuffers )
  {
    std::vector<uint8_t> Bytes;
    for( const auto& pBuffer : i_rBuffers )
    {
      Bytes.insert( Bytes.end(), pBuffer->Data(), pBuffer->Data() + pBuffer->Size() );
    }
    return Bytes;
  }

  const std::shared_ptr<VFakeDisk> m_pDisk;
  VFakeFile* m_pFile = nullptr;
  uint64_t m_Calls = 0;
};
