#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceImpl.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceModes.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>
#include <utility>

namespace VideoInputHAL
{

namespace
{

using namespace DeckLinkAPI;

constexpr int32_t InitialiseFailed = static_cast<int32_t>( 0x80000000u );
constexpr int32_t ModeNotFound = static_cast<int32_t>( 0x8000001Cu );
constexpr int32_t StartFailed = static_cast<int32_t>( 0x80000007u );

}

VBlackmagicDeckLinkDevice::VImpl::VImpl( IDeckLink* i_pCard, int32_t i_CardNumber, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService )
  : VCaptureDeviceState( "DeckLink C" + std::to_string( i_CardNumber ), i_pPostalService ), m_pCard( i_pCard )
{
}

// Newer callback interfaces are not answered: a runtime that finds one would report signals with bits that this generation does not know.
HRESULT VBlackmagicDeckLinkDevice::VImpl::QueryInterface( REFIID i_Id, void** o_ppObject )
{
  if( !o_ppObject )
  {
    return E_POINTER;
  }
  if( !( i_Id == IID_IUnknown ) && !( i_Id == IID_IDeckLinkInputCallback ) )
  {
    *o_ppObject = nullptr;
    return E_NOINTERFACE;
  }
  AddRef();
  *o_ppObject = static_cast<IDeckLinkInputCallback*>( this );
  return S_OK;
}

ULONG VBlackmagicDeckLinkDevice::VImpl::AddRef() { return ++m_References; }

ULONG VBlackmagicDeckLinkDevice::VImpl::Release()
{
  const ULONG References = --m_References;
  if( References == 0 )
  {
    delete this;
  }
  return References;
}

VDeviceResult VBlackmagicDeckLinkDevice::VImpl::Initialise()
{
  m_ControlMutex.lock();
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  boost::lock_guard<boost::mutex> Control( m_ControlMutex, boost::adopt_lock );
  m_pInput = VideoInputHAL::QueryInterface<IDeckLinkInput>( *m_pCard, IID_IDeckLinkInput );
  if( !m_pInput )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Could not query interface." );
    return { InitialiseFailed };
  }
  ReadCapabilities();
  if( !ReadModes() )
  {
    return { InitialiseFailed };
  }
  if( m_pInput->SetCallback( this ) < 0 )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Could not set callback." );
    return { InitialiseFailed };
  }
  return { StartStreaming() ? 0 : InitialiseFailed };
}

void VBlackmagicDeckLinkDevice::VImpl::Close()
{
  boost::lock_guard<boost::mutex> Control( m_ControlMutex );
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bClosed = true;
    m_bCapturing = false;
  }
  // Callbacks that wait for m_Mutex get it now and return at once, so StopStreams may wait for them.
  if( m_pInput )
  {
    m_pInput->StopStreams();
    m_pInput->DisableVideoInput();
  }
  std::vector<VComPointer<IDeckLinkDisplayMode>> Modes;
  VComPointer<IDeckLink> pCard;
  std::shared_ptr<IVideoInputAllocator> pAllocator;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_pInput )
    {
      m_pInput->SetCallback( nullptr );
    }
    Modes.swap( m_Modes );
    pCard.swap( m_pCard );
    pAllocator.swap( m_pAllocator );
  }
  Modes.clear();
  m_pInput.reset();
}

VDeviceResult VBlackmagicDeckLinkDevice::VImpl::StartCapture( KVZ::IPixelFormat::Enum i_PixelFormat, KVZ::ITimecodeSource::Enum i_TimecodeSource,
  KVZ::IAudioSampleFormat::Enum i_AudioFormat, uint32_t i_AudioChannels )
{
  m_ControlMutex.lock();
  if( m_pInput )
  {
    m_pInput->StopStreams();
  }
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  boost::lock_guard<boost::mutex> Control( m_ControlMutex, boost::adopt_lock );
  const VDeviceResult Result = Restart( { i_PixelFormat, i_TimecodeSource, i_AudioFormat, i_AudioChannels } );
  if( Result.Succeeded() )
  {
    m_TimecodeSource = i_TimecodeSource;
    m_PixelFormat = i_PixelFormat;
    m_bCapturing = true;
    m_StatusChanged();
  }
  else if( m_bCapturing )
  {
    m_bCapturing = false;
    m_StatusChanged();
  }
  return Result;
}

void VBlackmagicDeckLinkDevice::VImpl::StopCapture()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_bCapturing = false;
  m_StatusChanged();
}

HRESULT VBlackmagicDeckLinkDevice::VImpl::VideoInputFormatChanged( uint32_t, IDeckLinkDisplayMode* i_pNewMode, uint32_t i_DetectedSignal )
{
  const VComPointer<VImpl> pSelf( this );
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_bClosed || !i_pNewMode )
  {
    return S_OK;
  }
  SetMode( i_pNewMode->GetDisplayMode() );
  m_DetectedFormats.clear();
  if( i_DetectedSignal == DetectedSignal::YCbCr422 )
  {
    m_DetectedFormats = { KVZ::IPixelFormat::EU8Y8V8Y8, KVZ::IPixelFormat::EU10Y10V10Y10 };
  }
  else if( i_DetectedSignal == DetectedSignal::RGB444 )
  {
    m_DetectedFormats = { KVZ::IPixelFormat::EB8G8R8u8 };
  }
  m_VideoStandardChanged();
  m_PixelFormatsChanged();
  // Whoever has it brings the streams up in the mode that stands now.
  if( m_ControlMutex.try_lock() )
  {
    boost::lock_guard<boost::mutex> Control( m_ControlMutex, boost::adopt_lock );
    FollowFormat();
  }
  return S_OK;
}

void VBlackmagicDeckLinkDevice::VImpl::FollowFormat()
{
  m_pInput->PauseStreams();
  m_pInput->EnableVideoInput( m_Mode, ToVendorPixelFormat( m_PixelFormat ), InputFlag::FormatDetection );
  m_pInput->FlushStreams();
  m_pInput->StartStreams();
}

// A card that does not tell is taken for one that cannot.
void VBlackmagicDeckLinkDevice::VImpl::ReadCapabilities()
{
  auto pAttributes = VideoInputHAL::QueryInterface<IDeckLinkAttributes>( *m_pCard, IID_IDeckLinkAttributes );
  if( !pAttributes )
  {
    pAttributes = VideoInputHAL::QueryInterface<IDeckLinkAttributes>( *m_pCard, IID_IDeckLinkProfileAttributes );
  }
  bool bDetects = false;
  m_bDetectsFormat = pAttributes && pAttributes->GetFlag( AttributeId::SupportsInputFormatDetection, &bDetects ) >= 0 && bDetects;
  if( !m_bDetectsFormat )
  {
    KVZ_LOG( BlackmagicLogCategory, 5, "%1% does not detect the format of its input.", m_DisplayName );
  }
}

bool VBlackmagicDeckLinkDevice::VImpl::ReadModes()
{
  IDeckLinkDisplayModeIterator* pOut = nullptr;
  if( m_pInput->GetDisplayModeIterator( &pOut ) < 0 || !pOut )
  {
    return false;
  }
  const auto pIterator = TakeReference( pOut );
  IDeckLinkDisplayMode* pMode = nullptr;
  while( pIterator->Next( &pMode ) == S_OK && pMode )
  {
    m_Modes.push_back( TakeReference( std::exchange( pMode, nullptr ) ) );
  }
  return true;
}

bool VBlackmagicDeckLinkDevice::VImpl::StartStreaming()
{
  SetMode( FourCharacterCode( "ntsc" ) );
  return m_pInput->EnableVideoInput( m_Mode, ToVendorPixelFormat( m_PixelFormat ), InputFlag::FormatDetection ) >= 0 && m_pInput->StartStreams() >= 0;
}

VDeviceResult VBlackmagicDeckLinkDevice::VImpl::Restart( const VCaptureSettings& i_rSettings )
{
  if( !HasCurrentMode() )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Could not find requested mode." );
    return { ModeNotFound };
  }
  if( m_pInput->EnableVideoInput( m_Mode, ToVendorPixelFormat( i_rSettings.m_PixelFormat ), InputFlag::FormatDetection ) < 0 )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Unable to select the chosen video mode for capture.  Perhaps the selected device is in use." );
    return { StartFailed };
  }
  m_Audio = { i_rSettings.m_AudioFormat, AudioSampleRate48kHz, i_rSettings.m_AudioChannels };
  if( m_Audio.m_Channels != 0 && !EnableAudio() )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Unable to select the chosen audio mode for capture.  Perhaps the selected device is in use." );
    return { StartFailed };
  }
  if( m_pInput->StartStreams() < 0 )
  {
    KVZ_LOG( BlackmagicLogCategory, 2, "Unable to start the capture. Perhaps the selected device is in use." );
    return { StartFailed };
  }
  return {};
}

bool VBlackmagicDeckLinkDevice::VImpl::EnableAudio()
{
  return m_pInput->EnableAudioInput( ToVendorSampleRate( m_Audio.m_SampleRate ), ToVendorSampleType( m_Audio.m_SampleFormat ), m_Audio.m_Channels ) >=
    0;
}

// Empty once the device is closed.
bool VBlackmagicDeckLinkDevice::VImpl::HasCurrentMode() const
{
  return std::any_of( m_Modes.begin(), m_Modes.end(), [Mode = m_Mode]( const auto& i_pMode ) { return i_pMode->GetDisplayMode() == Mode; } );
}

void VBlackmagicDeckLinkDevice::VImpl::SetMode( uint32_t i_Mode )
{
  m_Mode = i_Mode;
  m_InterlacedFormat = KVZ::GetInterlacedFormat( ToVideoStandard( i_Mode ) );
}

}
