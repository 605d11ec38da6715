// The road of a frame from the vendor's thread to the data callback.
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceImpl.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceModes.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceTimecode.h"

#include "StageCoreRuntime/GlobalLog.h"
#include "SyncSystem/Tick.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>
#include <cstring>

namespace VideoInputHAL
{

namespace
{

using namespace DeckLinkAPI;

KVZ::VideoFrameInfo DescribeImage( IDeckLinkVideoInputFrame& i_rVideo, KVZ::IPixelFormat::Enum i_PixelFormat,
  KVZ::IInterlacedFormat::Enum i_Interlaced )
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = static_cast<uint32_t>( i_rVideo.GetWidth() );
  Info.m_ImageHeight = static_cast<uint32_t>( i_rVideo.GetHeight() );
  Info.m_PixelFormat = i_PixelFormat;
  Info.m_InterlacedFormat = i_Interlaced;
  return Info;
}

// False, with a line in the log, where the card has no bytes or more than an image of this kind holds.
bool FindImage( IDeckLinkVideoInputFrame& i_rVideo, uint64_t i_ImageBytes, std::span<const uint8_t>& o_rImage )
{
  void* pBytes = nullptr;
  if( i_rVideo.GetBytes( &pBytes ) < 0 || !pBytes )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Could not get bytes from video frame." );
    return false;
  }
  const uint64_t FrameBytes = static_cast<uint64_t>( i_rVideo.GetRowBytes() ) * static_cast<uint64_t>( i_rVideo.GetHeight() );
  if( FrameBytes > i_ImageBytes )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Need more memory than was to be requested." );
    return false;
  }
  o_rImage = { static_cast<const uint8_t*>( pBytes ), FrameBytes };
  return true;
}

// What the card puts into a sample where that is less than the format asked for: it knows 16 and 32 bits only.
uint64_t BytesPerSample( KVZ::IAudioSampleFormat::Enum i_Format )
{
  return std::min( KVZ::GetBytesPerSample( i_Format ), ToVendorSampleType( i_Format ) / 8 );
}

}

HRESULT VBlackmagicDeckLinkDevice::VImpl::VideoInputFrameArrived( IDeckLinkVideoInputFrame* i_pVideo, IDeckLinkAudioInputPacket* i_pAudio )
{
  // Both end after the lock: the receiver may be the device's last owner, and the vendor may have let this object go.
  const VComPointer<VImpl> pSelf( this );
  std::shared_ptr<IVideoInputDataCallback> pReceiver;
  if( i_pVideo )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    pReceiver = HandleFrame( *i_pVideo, i_pAudio );
  }
  return S_OK;
}

// Gives back the receiver, if the frame went so far, for the caller to let go.
std::shared_ptr<IVideoInputDataCallback> VBlackmagicDeckLinkDevice::VImpl::HandleFrame( IDeckLinkVideoInputFrame& i_rVideo,
  IDeckLinkAudioInputPacket* i_pAudio )
{
  if( m_bClosed )
  {
    return nullptr;
  }
  UpdateSignal( ( i_rVideo.GetFlags() & FrameFlag::NoInputSource ) == 0 );
  if( !m_bCapturing || !m_bHasSignal )
  {
    return nullptr;
  }
  CountDroppedFrames( i_rVideo );
  VTimecodeReading Reading = ReadTimecode( i_rVideo, m_TimecodeSource );
  if( FollowTimecode( Reading.m_Timecode, Reading.m_FramePeriod ) )
  {
    m_TimecodeChanged();
  }
  const KVZ::IPixelFormat::Enum PixelFormat = ToPixelFormat( i_rVideo.GetPixelFormat() );
  std::shared_ptr<IVideoInputDataCallback> pReceiver = m_pDataCallback.lock();
  if( !pReceiver )
  {
    return nullptr;
  }
  if( VVideoInputDataSourceFrame* pFrame = CopyFrame( i_rVideo, i_pAudio, PixelFormat ) )
  {
    pFrame->m_Timecode = Reading.m_Timecode;
    if( !pReceiver->OnVideoInputData( m_FrameIndex++, pFrame, &pFrame->m_Timecode, &Reading.m_FramePeriod ) )
    {
      m_pAllocator->Free( pFrame );
    }
  }
  return pReceiver;
}

void VBlackmagicDeckLinkDevice::VImpl::UpdateSignal( bool i_bHasSignal )
{
  if( i_bHasSignal == m_bHasSignal )
  {
    return;
  }
  m_bHasSignal = i_bHasSignal;
  m_VideoStandardChanged();
  m_PixelFormatsChanged();
  if( !m_bHasSignal && LoseTimecode() )
  {
    m_TimecodeChanged();
  }
}

// The first frame of all counts the card's whole running time. A clock that stands still or goes back misses nothing.
void VBlackmagicDeckLinkDevice::VImpl::CountDroppedFrames( IDeckLinkVideoInputFrame& i_rVideo )
{
  int64_t Time = 0;
  int64_t Duration = 0;
  if( i_rVideo.GetHardwareReferenceTimestamp( KVZ::VTick::TicksPerSecond, &Time, &Duration ) < 0 || Duration <= 0 )
  {
    return;
  }
  const int64_t Missed = ( Time - Duration - m_LastHardwareTime ) / Duration;
  if( Missed > 0 )
  {
    m_DroppedFrames( static_cast<unsigned int>( Missed ) );
  }
  m_LastHardwareTime = Time;
}

// Null, with a line in the log, where the frame is lost.
VVideoInputDataSourceFrame* VBlackmagicDeckLinkDevice::VImpl::CopyFrame( IDeckLinkVideoInputFrame& i_rVideo, IDeckLinkAudioInputPacket* i_pAudio,
  KVZ::IPixelFormat::Enum i_PixelFormat )
{
  const KVZ::VideoFrameInfo Info = DescribeImage( i_rVideo, i_PixelFormat, m_InterlacedFormat );
  const uint64_t ImageBytes = KVZ::GetImageSize( Info.m_PixelFormat, Info.m_ImageWidth, Info.m_ImageHeight );
  std::span<const uint8_t> Image;
  std::span<const uint8_t> Audio;
  if( !FindImage( i_rVideo, ImageBytes, Image ) || ( i_pAudio && !FindAudio( *i_pAudio, Audio ) ) )
  {
    return nullptr;
  }
  VVideoInputDataSourceFrame* const pFrame = MakeFrame( m_pAllocator.get(), Info, ImageBytes, Audio.size() );
  if( !pFrame )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Memory allocation failed." );
    return nullptr;
  }
  pFrame->m_DeviceIndex = m_DeviceIndex;
  std::memcpy( pFrame->Image(), Image.data(), Image.size() );
  std::memset( pFrame->Image() + Image.size(), 0, ImageBytes - Image.size() );
  if( !Audio.empty() )
  {
    pFrame->m_AudioInfo = m_Audio;
    std::memcpy( pFrame->Audio(), Audio.data(), Audio.size() );
  }
  return pFrame;
}

// False, with a line in the log, where the packet has no bytes to give.
bool VBlackmagicDeckLinkDevice::VImpl::FindAudio( IDeckLinkAudioInputPacket& i_rAudio, std::span<const uint8_t>& o_rAudio )
{
  const uint64_t Samples = static_cast<uint64_t>( std::max( i_rAudio.GetSampleFrameCount(), 0L ) );
  void* pBytes = nullptr;
  if( i_rAudio.GetBytes( &pBytes ) < 0 || !pBytes )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Could not get bytes from audio packet." );
    return false;
  }
  int64_t PacketTime = 0;
  i_rAudio.GetPacketTime( &PacketTime, m_Audio.m_SampleRate );   // audio follows its frame; the call is part of reading a packet
  o_rAudio = { static_cast<const uint8_t*>( pBytes ), Samples * BytesPerSample( m_Audio.m_SampleFormat ) * m_Audio.m_Channels };
  return true;
}

}
