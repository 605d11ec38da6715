#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Device.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444DeviceImpl.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Tables.h"

#include <boost/thread/lock_guard.hpp>

#include <utility>

namespace VideoInputHAL
{

using KVZ::IAudioSampleFormat;
using KVZ::IPixelFormat;
using KVZ::ITimecodeSource;

VBluefish444Device::VBluefish444Device( const VBluefish444Input& i_rInput, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService,
  VPause i_Pause )
  : VBluefish444Device( std::make_shared<VImpl>( i_rInput, i_pPostalService, std::move( i_Pause ) ) )
{
}

VBluefish444Device::VBluefish444Device( const std::shared_ptr<VImpl>& i_pImpl ) : VCaptureDevice( *i_pImpl ), m_pImpl( i_pImpl ) { m_pImpl->Start(); }

VBluefish444Device::~VBluefish444Device() { m_pImpl->Close(); }

void VBluefish444Device::Close() { m_pImpl->Close(); }

std::string VBluefish444Device::GetManufacturerName() const { return "Bluefish 444"; }

std::string VBluefish444Device::GetDriverName() const { return CardName( m_pImpl->GetCardType() ); }

KVZ::IVideoStandard::Enum VBluefish444Device::GetVideoStandard() const { return m_pImpl->GetVideoStandard(); }

IPixelFormat::Enum VBluefish444Device::GetPixelFormat() const { return IPixelFormat::EUnspecified; }

void VBluefish444Device::GetSupportedPixelFormats( std::set<IPixelFormat::Enum>& o_rFormats ) const
{
  o_rFormats = { IPixelFormat::EU10Y10V10Y10, IPixelFormat::EU8Y8V8Y8, IPixelFormat::EY8U8Y8V8, IPixelFormat::ER8G8B8u8, IPixelFormat::ER8G8B8,
    IPixelFormat::EB8G8R8u8, IPixelFormat::EB8G8R8, IPixelFormat::ELuminance8 };
}

void VBluefish444Device::GetSupportedTimecodeSources( std::set<ITimecodeSource::Enum>& o_rSources ) const
{
  o_rSources = { ITimecodeSource::EAny, ITimecodeSource::ERP188_Any, ITimecodeSource::ERP188_LTC, ITimecodeSource::ERP188_VITC1,
    ITimecodeSource::EExternal_LTC };
}

void VBluefish444Device::GetSupportedAudioSampleFormats( std::set<IAudioSampleFormat::Enum>& o_rFormats ) const
{
  o_rFormats = { IAudioSampleFormat::EInt16, IAudioSampleFormat::EInt24, IAudioSampleFormat::EInt32 };
}

void VBluefish444Device::GetSupportedAudioChannelCounts( std::set<uint32_t>& o_rCounts ) const
{
  o_rCounts.clear();
  for( uint32_t Count = 0; Count <= MostAudioChannels; ++Count )
  {
    o_rCounts.insert( Count );
  }
}

VDeviceResult VBluefish444Device::StartCapture( IPixelFormat::Enum i_PixelFormat, ITimecodeSource::Enum i_TimecodeSource,
  IAudioSampleFormat::Enum i_AudioFormat, uint32_t i_AudioChannels )
{
  m_pImpl->Order( { i_TimecodeSource, i_PixelFormat, i_AudioFormat, i_AudioChannels, true } );
  return {};
}

bool VBluefish444Device::StopCapture()
{
  m_pImpl->Order( {} );
  return true;
}

IVideoInputDevice::EStatus::Enum VBluefish444Device::GetStatus() const
{
  return m_pImpl->IsOrderedToCapture() ? EStatus::ECapturing : EStatus::EReady;
}

bool VBluefish444Device::IsCapturing() const { return m_pImpl->IsCapturing(); }

VBluefish444Device::VImpl::VImpl( const VBluefish444Input& i_rInput, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService, VPause i_Pause )
  : VCaptureDeviceState( CardName( i_rInput.m_CardType ) + " C" + std::to_string( i_rInput.m_CardNumber ) + ":Ch" +
        ChannelLetter( i_rInput.m_Channel ),
      i_pPostalService ),
    m_CardType( i_rInput.m_CardType ),
    m_Channel( i_rInput.m_Channel ),
    m_Pause( std::move( i_Pause ) ),
    m_NoSignalMode( i_rInput.m_pCard->Query( BlueVelvet::Property::InvalidVideoModeFlag ).value_or( DefaultNoSignalMode ) ),
    m_Mode( m_NoSignalMode ),
    m_pCard( i_rInput.m_pCard )
{
  m_DeviceIndex = i_rInput.m_DeviceIndex;
}

void VBluefish444Device::VImpl::Start()
{
  m_Thread = boost::thread( [pSelf = shared_from_this()] { pSelf->Run(); } );
}

void VBluefish444Device::VImpl::Close()
{
  std::shared_ptr<IVideoInputAllocator> pAllocator;   // ends without the lock, when no frame can come any more
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bStop = true;
    m_bOrdered = false;
    m_Commands.clear();
  }
  m_Stopping.notify_all();
  if( m_Thread.get_id() == boost::this_thread::get_id() )
  {
    m_Thread.detach();
    return;
  }
  if( m_Thread.joinable() )
  {
    m_Thread.join();
  }
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  pAllocator.swap( m_pAllocator );
}

void VBluefish444Device::VImpl::Order( const VCaptureCommand& i_rCommand )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !m_bStop )
  {
    m_Commands.push_back( i_rCommand );
    m_bOrdered = i_rCommand.m_bStart;
  }
}

bool VBluefish444Device::VImpl::IsOrderedToCapture() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_bOrdered;
}

bool VBluefish444Device::VImpl::IsCapturing() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_bCapturing;
}

bool VBluefish444Device::VImpl::IsStopping() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_bStop;
}

// By the driver's own value for no signal, whatever the table says of that number.
KVZ::IVideoStandard::Enum VBluefish444Device::VImpl::StandardOf( uint32_t i_Mode ) const
{
  return i_Mode == m_NoSignalMode ? KVZ::IVideoStandard::EUnspecified : StandardOfMode( i_Mode );
}

}
