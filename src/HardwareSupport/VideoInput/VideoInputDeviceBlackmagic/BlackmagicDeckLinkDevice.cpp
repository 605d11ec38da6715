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
  : VBlackmagicDeckLinkDevice( TakeReference( new VImpl( i_pCard, i_CardNumber, i_pPostalService ) ) )
{
}

VBlackmagicDeckLinkDevice::VBlackmagicDeckLinkDevice( boost::intrusive_ptr<VImpl> i_pImpl )
  : VCaptureDevice( *i_pImpl ), m_pImpl( std::move( i_pImpl ) )
{
}

VBlackmagicDeckLinkDevice::~VBlackmagicDeckLinkDevice() { m_pImpl->Close(); }

VDeviceResult VBlackmagicDeckLinkDevice::Initialise() { return m_pImpl->Initialise(); }

void VBlackmagicDeckLinkDevice::Close() { m_pImpl->Close(); }

std::string VBlackmagicDeckLinkDevice::GetManufacturerName() const { return "Blackmagic Design"; }

std::string VBlackmagicDeckLinkDevice::GetDriverName() const { return "DeckLink"; }

KVZ::IVideoStandard::Enum VBlackmagicDeckLinkDevice::GetVideoStandard() const { return m_pImpl->GetVideoStandard(); }

IPixelFormat::Enum VBlackmagicDeckLinkDevice::GetPixelFormat() const { return m_pImpl->GetPixelFormat(); }

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

}
