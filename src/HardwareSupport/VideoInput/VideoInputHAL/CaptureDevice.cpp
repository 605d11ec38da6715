#include "HardwareSupport/VideoInput/VideoInputHAL/CaptureDevice.h"

#include <boost/thread/lock_guard.hpp>

#include <utility>

namespace VideoInputHAL
{

VCaptureDeviceState::VCaptureDeviceState( std::string i_DisplayName, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService )
  : m_DroppedFrames( i_pPostalService ),
    m_StatusChanged( i_pPostalService ),
    m_PixelFormatsChanged( i_pPostalService ),
    m_VideoStandardChanged( i_pPostalService ),
    m_TimecodeChanged( i_pPostalService ),
    m_DisplayName( std::move( i_DisplayName ) )
{
}

void VCaptureDeviceState::SetDeviceIndex( int32_t i_Index )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_DeviceIndex = i_Index;
  m_URN = MakeDeviceURN( i_Index );
}

void VCaptureDeviceState::SetDataCallback( std::weak_ptr<IVideoInputDataCallback> i_pCallback )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_pDataCallback.swap( i_pCallback );
}

void VCaptureDeviceState::SetAllocator( std::shared_ptr<IVideoInputAllocator> i_pAllocator )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_pAllocator.swap( i_pAllocator );   // the former one ends with the argument, without the lock
}

std::string VCaptureDeviceState::GetDeviceURN() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_URN;
}

int32_t VCaptureDeviceState::GetDeviceIndex() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_DeviceIndex;
}

KVZ::ITimecode VCaptureDeviceState::GetTimecode() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_LastTimecode;
}

bool VCaptureDeviceState::FollowTimecode( KVZ::ITimecode& io_rTimecode, int64_t i_Period )
{
  const bool bRepeated = KVZ::IsSameReading( io_rTimecode, m_LastTimecode );
  const bool bOtherStandard = io_rTimecode.m_Standard != m_LastTimecode.m_Standard;
  m_Repeats = bRepeated ? m_Repeats + 1 : 0;
  if( !bRepeated )
  {
    m_LastTimecode = io_rTimecode;
  }
  KVZ::AddTicks( io_rTimecode, m_Repeats * i_Period );
  return bOtherStandard;
}

bool VCaptureDeviceState::LoseTimecode()
{
  const bool bLost = KVZ::IsValid( m_LastTimecode );
  m_LastTimecode = bLost ? KVZ::ITimecode() : m_LastTimecode;
  return bLost;
}

void VCaptureDevice::SetDeviceIndex( int32_t i_Index ) { m_rState.SetDeviceIndex( i_Index ); }

IVideoInputDevice::VCountCallback& VCaptureDevice::GetDroppedFramesCallback() { return m_rState.m_DroppedFrames; }

IVideoInputDevice::VEventCallback& VCaptureDevice::GetStatusChangedCallback() { return m_rState.m_StatusChanged; }

IVideoInputDevice::VEventCallback& VCaptureDevice::GetPixelFormatsChangedCallback() { return m_rState.m_PixelFormatsChanged; }

IVideoInputDevice::VEventCallback& VCaptureDevice::GetVideoStandardChangedCallback() { return m_rState.m_VideoStandardChanged; }

IVideoInputDevice::VEventCallback& VCaptureDevice::GetTimecodeChangedCallback() { return m_rState.m_TimecodeChanged; }

void VCaptureDevice::SetDataCallback( std::shared_ptr<IVideoInputDataCallback> i_pCallback ) { m_rState.SetDataCallback( i_pCallback ); }

void VCaptureDevice::SetAllocator( std::shared_ptr<IVideoInputAllocator> i_pAllocator ) { m_rState.SetAllocator( std::move( i_pAllocator ) ); }

std::string VCaptureDevice::GetDeviceName() const { return m_rState.GetDeviceName(); }

std::string VCaptureDevice::GetDeviceURN() const { return m_rState.GetDeviceURN(); }

KVZ::ITimecode VCaptureDevice::GetTimecode() const { return m_rState.GetTimecode(); }

void VCaptureDevice::GetSupportedAudioSampleRates( std::set<uint32_t>& o_rRates ) const { o_rRates = { AudioSampleRate }; }

int32_t VCaptureDevice::GetDeviceIndex() const { return m_rState.GetDeviceIndex(); }

}
