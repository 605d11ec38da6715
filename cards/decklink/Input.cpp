#include "cards/decklink/Input.h"

#include "cards/decklink/VirtualDeckLink.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

namespace VirtualCards
{

using namespace DeckLinkAPI;

namespace
{

constexpr size_t MostSlots = 16;   // frames that clients may keep before the card has none left

KVZ::IPixelFormat::Enum ToPixelFormat( uint32_t i_Format )
{
  switch( i_Format )
  {
    case PixelFormat::YUV8Bit: return KVZ::IPixelFormat::EU8Y8V8Y8;
    case PixelFormat::YUV10Bit: return KVZ::IPixelFormat::EU10Y10V10Y10;
    case PixelFormat::BGRA8Bit: return KVZ::IPixelFormat::EB8G8R8u8;
    default: return KVZ::IPixelFormat::EUnspecified;
  }
}

bool IsKnownFlags( uint32_t i_Flags ) { return ( i_Flags & ~InputFlag::FormatDetection ) == 0; }

}

VInput::VInput( IUnknown& i_rOwner, std::weak_ptr<VVirtualDeckLink> i_pCard )
  : m_rOwner( i_rOwner ), m_pCard( std::move( i_pCard ) ), m_pSlots( std::make_shared<VInputSlots>( MostSlots ) )
{
}

VInput::~VInput() = default;

HRESULT VInput::DoesSupportVideoMode( uint32_t i_DisplayMode, uint32_t i_PixelFormat, uint32_t i_InputFlags, uint32_t* o_pSupport,
  IDeckLinkDisplayMode** o_ppMode )
{
  if( !o_pSupport )
  {
    return E_POINTER;
  }
  const VDisplayModeRow* pMode = FindDisplayMode( i_DisplayMode );
  const bool bSupported = pMode && ToPixelFormat( i_PixelFormat ) != KVZ::IPixelFormat::EUnspecified && IsKnownFlags( i_InputFlags );
  *o_pSupport = bSupported ? ModeSupport::Yes : ModeSupport::No;
  if( o_ppMode )
  {
    *o_ppMode = bSupported ? MakeDisplayMode( *pMode ) : nullptr;
  }
  return S_OK;
}

HRESULT VInput::GetDisplayModeIterator( IDeckLinkDisplayModeIterator** o_ppIterator )
{
  if( !o_ppIterator )
  {
    return E_POINTER;
  }
  *o_ppIterator = MakeDisplayModeIterator();
  return S_OK;
}

HRESULT VInput::SetScreenPreviewCallback( IDeckLinkScreenPreviewCallback* i_pCallback )
{
  return i_pCallback ? E_NOTIMPL : S_OK;   // a virtual card has no preview
}

HRESULT VInput::EnableVideoInput( uint32_t i_DisplayMode, uint32_t i_PixelFormat, uint32_t i_InputFlags )
{
  const VDisplayModeRow* pMode = FindDisplayMode( i_DisplayMode );
  const KVZ::IPixelFormat::Enum Format = ToPixelFormat( i_PixelFormat );
  if( !pMode || Format == KVZ::IPixelFormat::EUnspecified || !IsKnownFlags( i_InputFlags ) )
  {
    return E_INVALIDARG;
  }
  const std::shared_ptr<VVirtualDeckLink> pCard = m_pCard.lock();
  if( pCard && pCard->IsBusy() )
  {
    return E_ACCESSDENIED;
  }
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_bRemoved )
  {
    return E_FAIL;
  }
  m_Video = VVideo{ pMode, i_PixelFormat, i_InputFlags, { KVZ::FindVideoStandard( pMode->m_Standard ), Format } };
  m_bAnnounceOnMismatch = true;
  return S_OK;
}

HRESULT VInput::DisableVideoInput()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_Streams == EStreams::Running )
  {
    return E_ACCESSDENIED;
  }
  m_Video.reset();
  return S_OK;
}

HRESULT VInput::GetAvailableVideoFrameCount( uint32_t* o_pCount )
{
  if( !o_pCount )
  {
    return E_POINTER;
  }
  *o_pCount = 0;   // frames are handed over as they come
  return S_OK;
}

HRESULT VInput::SetVideoInputFrameMemoryAllocator( IDeckLinkMemoryAllocator* i_pAllocator ) { return i_pAllocator ? E_NOTIMPL : S_OK; }

HRESULT VInput::EnableAudioInput( uint32_t i_SampleRate, uint32_t i_SampleType, uint32_t i_Channels )
{
  const bool bType = i_SampleType == AudioSampleType::Int16 || i_SampleType == AudioSampleType::Int32;
  const bool bChannels = i_Channels == 2 || i_Channels == 8 || i_Channels == 16;
  if( i_SampleRate != AudioSampleRate48kHz || !bType || !bChannels )
  {
    return E_INVALIDARG;
  }
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_bRemoved || m_Streams == EStreams::Running )
  {
    return m_bRemoved ? E_FAIL : E_ACCESSDENIED;
  }
  m_Audio = VSoundLayout{ i_SampleType, i_Channels };
  return S_OK;
}

HRESULT VInput::DisableAudioInput()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_Streams == EStreams::Running )
  {
    return E_ACCESSDENIED;
  }
  m_Audio.reset();
  return S_OK;
}

HRESULT VInput::GetAvailableAudioSampleFrameCount( uint32_t* o_pCount ) { return GetAvailableVideoFrameCount( o_pCount ); }

HRESULT VInput::StartStreams()
{
  const std::shared_ptr<VVirtualDeckLink> pCard = m_pCard.lock();
  VVideo Video;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_bRemoved || !pCard || !m_Video || m_Streams == EStreams::Running )
    {
      return m_bRemoved || !pCard ? E_FAIL : m_Streams == EStreams::Running ? E_ACCESSDENIED : E_UNEXPECTED;
    }
    Video = *m_Video;
  }
  // Outside the lock: a clip takes its time. A frame that waits for this call meanwhile is history.
  if( Video.m_pMode->m_Standard == pCard->Runner().Standard() )
  {
    pCard->Content().Prepare( Video.m_Picture );
  }
  const bool bStale = pCard->Runner().IsCardThread() && pCard->Runner().SkipToNow() > 0;

  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_bRemoved || m_Streams == EStreams::Running )
  {
    return m_bRemoved ? E_FAIL : E_ACCESSDENIED;
  }
  m_bFrameStale = m_bFrameStale || bStale;
  m_Streams = EStreams::Running;
  m_StreamOrigin.reset();
  m_bAnnounceOnMismatch = true;
  return S_OK;
}

HRESULT VInput::StopStreams() NO_LOCK_ANALYSIS
{
  boost::unique_lock<boost::mutex> Lock( m_Mutex );
  if( !IsInFlightHere() )
  {
    ++m_StopsWaiting;
    m_FlightEnded.wait( Lock, [this]() NO_LOCK_ANALYSIS { return !m_bInFlight; } );
    --m_StopsWaiting;
  }
  const bool bStopped = m_Streams != EStreams::Stopped;
  m_Streams = EStreams::Stopped;
  return bStopped ? S_OK : S_FALSE;
}

HRESULT VInput::PauseStreams()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_Streams == EStreams::Stopped )
  {
    return E_ACCESSDENIED;
  }
  m_Streams = m_Streams == EStreams::Running ? EStreams::Paused : EStreams::Running;
  return S_OK;
}

HRESULT VInput::FlushStreams()
{
  return S_OK;   // frames are handed over as they come: there never is one to forget
}

HRESULT VInput::SetCallback( IDeckLinkInputCallback* i_pCallback )
{
  std::shared_ptr<VCallback> pCallback = i_pCallback ? std::make_shared<VCallback>( i_pCallback ) : nullptr;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_pCallback.swap( pCallback );
  }
  return S_OK;   // the former one is released here, without the lock
}

HRESULT VInput::GetHardwareReferenceClock( int64_t i_TimeScale, int64_t* o_pHardwareTime, int64_t* o_pTimeInFrame, int64_t* o_pTicksPerFrame )
{
  if( i_TimeScale <= 0 )
  {
    return E_INVALIDARG;
  }
  if( !o_pHardwareTime || !o_pTimeInFrame || !o_pTicksPerFrame )
  {
    return E_POINTER;
  }
  const std::shared_ptr<VVirtualDeckLink> pCard = m_pCard.lock();
  if( !pCard )
  {
    return E_FAIL;
  }
  const int64_t Now = pCard->Runner().Now();
  const int64_t Period = KVZ::GetFramePeriod( pCard->Runner().Standard() );
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  *o_pHardwareTime = ToScale( HardwareTimeOrigin + Now, i_TimeScale );
  *o_pTimeInFrame = ToScale( Now - m_LastFrameTime, i_TimeScale );
  *o_pTicksPerFrame = ToScale( Period, i_TimeScale );
  return S_OK;
}

void VInput::OnRemoved()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_bRemoved = true;
  m_Streams = EStreams::Stopped;
}

}
