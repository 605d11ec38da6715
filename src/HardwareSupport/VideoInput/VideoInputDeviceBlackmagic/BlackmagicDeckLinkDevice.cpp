#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDevice.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceImpl.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceModes.h"

#include <boost/thread/lock_guard.hpp>

#include <utility>

namespace VideoInputHAL
{

using KVZ::IAudioSampleFormat;
using KVZ::IPixelFormat;
using KVZ::ITimecodeSource;

VBlackmagicDeckLinkDevice::VBlackmagicDeckLinkDevice( DeckLinkAPI::IDeckLink* i_pCard, int32_t i_CardNumber,
  const std::shared_ptr<KVZ::IPostalService>& i_pPostalService )
  : m_pImpl( TakeReference( new VImpl( i_pCard, i_CardNumber, i_pPostalService ) ) )
{
}

VBlackmagicDeckLinkDevice::~VBlackmagicDeckLinkDevice() { m_pImpl->Close(); }

VDeviceResult VBlackmagicDeckLinkDevice::Initialise() { return m_pImpl->Initialise(); }

void VBlackmagicDeckLinkDevice::Close() { m_pImpl->Close(); }

void VBlackmagicDeckLinkDevice::SetDeviceIndex( int32_t i_Index ) { m_pImpl->SetDeviceIndex( i_Index ); }

IVideoInputDevice::VCountCallback& VBlackmagicDeckLinkDevice::GetDroppedFramesCallback() { return m_pImpl->m_DroppedFrames; }

IVideoInputDevice::VEventCallback& VBlackmagicDeckLinkDevice::GetStatusChangedCallback() { return m_pImpl->m_StatusChanged; }

IVideoInputDevice::VEventCallback& VBlackmagicDeckLinkDevice::GetPixelFormatsChangedCallback() { return m_pImpl->m_PixelFormatsChanged; }

IVideoInputDevice::VEventCallback& VBlackmagicDeckLinkDevice::GetVideoStandardChangedCallback() { return m_pImpl->m_VideoStandardChanged; }

IVideoInputDevice::VEventCallback& VBlackmagicDeckLinkDevice::GetTimecodeChangedCallback() { return m_pImpl->m_TimecodeChanged; }

void VBlackmagicDeckLinkDevice::SetDataCallback( std::shared_ptr<IVideoInputDataCallback> i_pCallback ) { m_pImpl->SetDataCallback( i_pCallback ); }

void VBlackmagicDeckLinkDevice::SetAllocator( std::shared_ptr<IVideoInputAllocator> i_pAllocator )
{
  m_pImpl->SetAllocator( std::move( i_pAllocator ) );
}

std::string VBlackmagicDeckLinkDevice::GetManufacturerName() const { return "Blackmagic Design"; }

std::string VBlackmagicDeckLinkDevice::GetDriverName() const { return "DeckLink"; }

std::string VBlackmagicDeckLinkDevice::GetDeviceName() const { return m_pImpl->GetDeviceName(); }

std::string VBlackmagicDeckLinkDevice::GetDeviceURN() const { return m_pImpl->GetDeviceURN(); }

KVZ::IVideoStandard::Enum VBlackmagicDeckLinkDevice::GetVideoStandard() const { return m_pImpl->GetVideoStandard(); }

IPixelFormat::Enum VBlackmagicDeckLinkDevice::GetPixelFormat() const { return m_pImpl->GetPixelFormat(); }

KVZ::ITimecode VBlackmagicDeckLinkDevice::GetTimecode() const { return m_pImpl->GetTimecode(); }

void VBlackmagicDeckLinkDevice::GetSupportedPixelFormats( std::set<IPixelFormat::Enum>& o_rFormats ) const
{
  o_rFormats = m_pImpl->GetSupportedPixelFormats();
}

void VBlackmagicDeckLinkDevice::GetSupportedTimecodeSources( std::set<ITimecodeSource::Enum>& o_rSources ) const
{
  o_rSources = { ITimecodeSource::EAny, ITimecodeSource::ERP188_Any, ITimecodeSource::ERP188_LTC, ITimecodeSource::ERP188_VITC1,
    ITimecodeSource::ERP188_VITC2, ITimecodeSource::EVITC_Field1, ITimecodeSource::EVITC_Field2, ITimecodeSource::ESerial };
}

void VBlackmagicDeckLinkDevice::GetSupportedAudioSampleFormats( std::set<IAudioSampleFormat::Enum>& o_rFormats ) const
{
  o_rFormats = { IAudioSampleFormat::EInt16, IAudioSampleFormat::EInt32 };
}

void VBlackmagicDeckLinkDevice::GetSupportedAudioSampleRates( std::set<uint32_t>& o_rRates ) const
{
  o_rRates = { DeckLinkAPI::AudioSampleRate48kHz };
}

void VBlackmagicDeckLinkDevice::GetSupportedAudioChannelCounts( std::set<uint32_t>& o_rCounts ) const { o_rCounts = { 0, 2, 8, 16 }; }

VDeviceResult VBlackmagicDeckLinkDevice::StartCapture( IPixelFormat::Enum i_PixelFormat, ITimecodeSource::Enum i_TimecodeSource,
  IAudioSampleFormat::Enum i_AudioFormat, uint32_t i_AudioChannels )
{
  return m_pImpl->StartCapture( i_PixelFormat, i_TimecodeSource, i_AudioFormat, i_AudioChannels );
}

bool VBlackmagicDeckLinkDevice::StopCapture()
{
  m_pImpl->StopCapture();
  return true;
}

IVideoInputDevice::EStatus::Enum VBlackmagicDeckLinkDevice::GetStatus() const
{
  return m_pImpl->IsCapturing() ? EStatus::ECapturing : EStatus::EReady;
}

int32_t VBlackmagicDeckLinkDevice::GetDeviceIndex() const { return m_pImpl->GetDeviceIndex(); }

void VBlackmagicDeckLinkDevice::VImpl::SetDeviceIndex( int32_t i_Index )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_DeviceIndex = i_Index;
  m_URN = MakeDeviceURN( i_Index );
}

void VBlackmagicDeckLinkDevice::VImpl::SetDataCallback( std::weak_ptr<IVideoInputDataCallback> i_pCallback )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_pDataCallback.swap( i_pCallback );
}

void VBlackmagicDeckLinkDevice::VImpl::SetAllocator( std::shared_ptr<IVideoInputAllocator> i_pAllocator )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_pAllocator.swap( i_pAllocator );   // the former one ends with the argument, without the lock
}

std::string VBlackmagicDeckLinkDevice::VImpl::GetDeviceURN() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_URN;
}

KVZ::IVideoStandard::Enum VBlackmagicDeckLinkDevice::VImpl::GetVideoStandard() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_bHasSignal ? ToVideoStandard( m_Mode ) : KVZ::IVideoStandard::EUnspecified;
}

IPixelFormat::Enum VBlackmagicDeckLinkDevice::VImpl::GetPixelFormat() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_PixelFormat;
}

KVZ::ITimecode VBlackmagicDeckLinkDevice::VImpl::GetTimecode() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_LastTimecode;
}

std::set<IPixelFormat::Enum> VBlackmagicDeckLinkDevice::VImpl::GetSupportedPixelFormats() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_bHasSignal ? m_DetectedFormats
                      : std::set<IPixelFormat::Enum>{ IPixelFormat::EU8Y8V8Y8, IPixelFormat::EU10Y10V10Y10, IPixelFormat::EB8G8R8u8 };
}

bool VBlackmagicDeckLinkDevice::VImpl::IsCapturing() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_bCapturing;
}

int32_t VBlackmagicDeckLinkDevice::VImpl::GetDeviceIndex() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_DeviceIndex;
}

}
