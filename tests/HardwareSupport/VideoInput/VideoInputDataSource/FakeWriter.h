// A writer that keeps what it is given, insists on the order of the calls, and fails at the call that a test names.
#pragma once

#include "Core/VideoInterface/VideoWriter.h"
#include "tests/support/TestFrames.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <atomic>
#include <cstdint>
#include <limits>
#include <map>
#include <memory>
#include <new>
#include <set>
#include <string>
#include <vector>

struct VFakeFile
{
  static constexpr uint64_t Never = std::numeric_limits<uint64_t>::max();

  uint64_t m_FailingCall = Never;   // 0 opens, 1 writes the header, 2 the first frame and so on
  bool m_bThrows = false;           // a frame that fails throws: memory runs out around the writer
  std::set<uint64_t> m_FailingKeys;
  bool m_bCloseFails = false;
  uint64_t m_IncompleteFrames = 0;   // as the writer counts them

  bool m_bOpen = false;
  int m_Closes = 0;
  bool m_bClosedWithAFrameInHand = false;
  bool m_bHeaded = false;
  KVZ::VideoFrameInfo m_Video;
  KVZ::AudioFrameInfo m_Audio;
  KVZ::VTimingRecord m_Timing;
  KVZ::ITimecode m_Timecode;
  KVZ::IAudioPayload::Enum m_AudioPayload{};
  std::string m_CaptureName;
  KVZ::VCameraHardwareRecord m_Camera;
  std::vector<KVZ::VConversionRecord> m_Conversion;
  std::map<uint64_t, std::vector<uint8_t>> m_Frames;   // by their keys
  std::map<uint64_t, std::vector<uint8_t>> m_Sound;
  std::map<uint64_t, const uint8_t*> m_Addresses;   // of the frames' bytes as they were given
};

// What lies on the disk, by path.
using VFakeDisk = std::map<std::string, VFakeFile>;

// Several threads may write frames at once, as they do where the container is a sequence of images.
class VFakeWriter : public KVZ::IVideoWriter
{
public:
  VFakeWriter( std::shared_ptr<VFakeDisk> i_pDisk, KVZ::IVideoContainer::Enum i_Container )
    : m_pDisk( std::move( i_pDisk ) ), m_Container( i_Container )
  {
  }

  const KVZ::IVideoWriterCapabilities& GetCapabilities() const override { return KVZ::GetVideoWriterCapabilities( m_Container ); }
  bool Open( const std::string& i_rPath ) override
  {
    m_pFile = &( *m_pDisk )[i_rPath];
    m_pFile->m_bOpen = Succeeds();
    return m_pFile->m_bOpen;
  }
  bool IsOpen() const override { return m_pFile && m_pFile->m_bOpen; }
  bool WriteHeader( const KVZ::VideoFrameInfo& i_rVideoInfo, const KVZ::AudioFrameInfo& i_rAudioInfo, const KVZ::VTimingRecord& i_rTiming,
    const KVZ::ITimecode& i_rTimecode, const KVZ::VColourRecord&, const KVZ::IVideoAttributes& i_rAttributes, KVZ::IVideoPayload::Enum,
    KVZ::IAudioPayload::Enum i_AudioPayload ) override
  {
    m_pFile->m_Video = i_rVideoInfo;
    m_pFile->m_Audio = i_rAudioInfo;
    m_pFile->m_Timing = i_rTiming;
    m_pFile->m_Timecode = i_rTimecode;
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
    ++m_InHand;
    const bool bWritten = Keep( io_rVideo, io_rAudio, i_FrameKey );
    --m_InHand;
    if( !bWritten && m_pFile->m_bThrows )
    {
      throw std::bad_alloc();
    }
    return bWritten;
  }
  bool Close() override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_pFile->m_bOpen = false;
    m_pFile->m_bClosedWithAFrameInHand = m_InHand != 0;
    ++m_pFile->m_Closes;
    return !m_pFile->m_bCloseFails;
  }
  uint64_t CountIncompleteFrames() const override { return m_pFile->m_IncompleteFrames; }

private:
  bool Succeeds() { return m_Calls++ != m_pFile->m_FailingCall; }
  bool Keep( const KVZ::VBufferList& i_rVideo, const KVZ::VBufferList& i_rAudio, uint64_t i_Key )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( !IsOpen() || !m_pFile->m_bHeaded || !Succeeds() || m_pFile->m_FailingKeys.count( i_Key ) != 0 )
    {
      return false;
    }
    m_pFile->m_Addresses[i_Key] = i_rVideo.front()->Data();
    m_pFile->m_Sound[i_Key] = TestSupport::BytesOf( i_rAudio );
    return m_pFile->m_Frames.emplace( i_Key, TestSupport::BytesOf( i_rVideo ) ).second;
  }

  const std::shared_ptr<VFakeDisk> m_pDisk;
  const KVZ::IVideoContainer::Enum m_Container;
  boost::mutex m_Mutex;
  std::atomic<int> m_InHand{ 0 };
  VFakeFile* m_pFile = nullptr;
  uint64_t m_Calls = 0;
};
