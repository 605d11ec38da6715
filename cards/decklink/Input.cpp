#include "cards/decklink/Input.h"

#include "cards/decklink/VirtualDeckLink.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

#include <array>

namespace VirtualCards
{

using namespace DeckLinkAPI;

namespace
{

constexpr size_t MostSlots = 16;   // frames that clients may keep before the card has none left
constexpr int64_t HardwareTimeOrigin = 3600ll * 135000000;   // the card has been running for an hour: its time has no meaning in itself

std::atomic<int32_t> g_CallbacksInFlight{ 0 };

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

bool IsRGB( uint32_t i_Format )
{
  return i_Format == PixelFormat::BGRA8Bit;
}

bool IsKnownFlags( uint32_t i_Flags )
{
  return ( i_Flags & ~InputFlag::FormatDetection ) == 0;
}

// Counts a running callback.
struct VCallbackCount
{
  VCallbackCount() { ++g_CallbacksInFlight; }
  ~VCallbackCount() { --g_CallbacksInFlight; }
};

}

int32_t CallbacksInFlight()
{
  return g_CallbacksInFlight;
}

// The time in which callbacks for one frame are made.
class VInput::VFlight
{
public:
  VFlight( VInput& i_rInput, const VSignalFrame& i_rFrame ) : m_rInput( i_rInput ), m_bBegun( i_rInput.BeginFlight( i_rFrame ) ) {}
  ~VFlight()
  {
    if( m_bBegun )
    {
      m_rInput.EndFlight();
    }
  }
  VFlight( const VFlight& ) = delete;
  VFlight& operator=( const VFlight& ) = delete;

  bool HasBegun() const { return m_bBegun; }

private:
  VInput& m_rInput;
  const bool m_bBegun;
};

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

HRESULT VInput::SetVideoInputFrameMemoryAllocator( IDeckLinkMemoryAllocator* i_pAllocator )
{
  return i_pAllocator ? E_NOTIMPL : S_OK;
}

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

HRESULT VInput::GetAvailableAudioSampleFrameCount( uint32_t* o_pCount )
{
  return GetAvailableVideoFrameCount( o_pCount );
}

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
    m_FlightEnded.wait( Lock, [ this ]() NO_LOCK_ANALYSIS { return !m_bInFlight; } );
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

void VInput::OnFrame( const VSignalFrame& i_rFrame )
{
  const VFlight Flight( *this, i_rFrame );
  if( Flight.HasBegun() )
  {
    Announce( i_rFrame );
    Deliver( i_rFrame );
  }
}

bool VInput::BeginFlight( const VSignalFrame& i_rFrame )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_LastFrameTime = i_rFrame.m_Time;
  if( m_pLastStandard != i_rFrame.m_pStandard )
  {
    m_pLastStandard = i_rFrame.m_pStandard;
    m_bAnnounceOnMismatch = true;
  }
  m_bFrameStale = false;
  m_bInFlight = MayCallLocked();
  m_FlightThread = boost::this_thread::get_id();
  return m_bInFlight;
}

void VInput::EndFlight()
{
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bInFlight = false;
  }
  m_FlightEnded.notify_all();
}

bool VInput::IsInFlightHere() const
{
  return m_bInFlight && m_FlightThread == boost::this_thread::get_id();
}

uint32_t VInput::FormatEventsLocked( const VSignalFrame& i_rFrame ) const
{
  if( !i_rFrame.m_bSignal || !m_Video || !( m_Video->m_Flags & InputFlag::FormatDetection ) )
  {
    return 0;
  }
  uint32_t Events = m_bEverAnnounced ? 0 : FormatChange::ColourSpace;
  if( m_bAnnounceOnMismatch )
  {
    const VDisplayModeRow& rSignal = *FindDisplayMode( i_rFrame.m_pStandard->m_Standard );
    Events |= rSignal.m_Code != m_Video->m_pMode->m_Code ? FormatChange::DisplayMode : 0;
    Events |= FieldDominanceOf( rSignal ) != FieldDominanceOf( *m_Video->m_pMode ) ? FormatChange::FieldDominance : 0;
    Events |= IsRGB( m_Video->m_PixelFormat ) ? FormatChange::ColourSpace : 0;
  }
  return Events;
}

void VInput::Announce( const VSignalFrame& i_rFrame )
{
  uint32_t Events = 0;
  std::shared_ptr<VCallback> pCallback;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Events = MayCallLocked() ? FormatEventsLocked( i_rFrame ) : 0;
    if( Events == 0 )
    {
      return;
    }
    m_bEverAnnounced = true;
    m_bAnnounceOnMismatch = false;
    pCallback = m_pCallback;
  }
  if( const std::shared_ptr<VVirtualDeckLink> pCard = m_pCard.lock() )
  {
    pCard->CountFormatChange();
  }
  IDeckLinkDisplayMode* pMode = MakeDisplayMode( *FindDisplayMode( i_rFrame.m_pStandard->m_Standard ) );
  {
    const VCallbackCount Count;
    ( *pCallback )->VideoInputFormatChanged( Events, pMode, DetectedSignal::YCbCr422 );
  }
  pMode->Release();
}

bool VInput::PlanDelivery( const VSignalFrame& i_rFrame, VDelivery& o_rDelivery )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !MayCallLocked() || !m_Video || m_bFrameStale )
  {
    return false;
  }
  m_StreamOrigin = m_StreamOrigin.value_or( i_rFrame.m_Time );
  o_rDelivery = { m_pCallback, *m_Video, m_Audio, i_rFrame.m_Time - *m_StreamOrigin };
  return true;
}

bool VInput::MayStillCall()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return MayCallLocked();
}

std::shared_ptr<const IPainter> VInput::Black( const VPictureFormat& i_rFormat )
{
  if( !m_pBlack || m_BlackFormat != i_rFormat )
  {
    m_pBlack = MakeBlackPainter( i_rFormat );
    m_BlackFormat = i_rFormat;
  }
  return m_pBlack;
}

// Without a signal in the enabled mode the card gives black frames of that mode, and silence, at the signal's pace.
void VInput::FillSlot( const VSignalFrame& i_rFrame, const VDelivery& i_rDelivery, VInputSlot& o_rSlot )
{
  const VPictureFormat& rFormat = i_rDelivery.m_Video.m_Picture;
  const std::shared_ptr<VVirtualDeckLink> pCard = m_pCard.lock();
  o_rSlot.m_bSignal = pCard && i_rFrame.m_bSignal && rFormat.m_pStandard == i_rFrame.m_pStandard &&
                      pCard->Content().Take( i_rFrame, rFormat, o_rSlot.m_Frame );
  if( !o_rSlot.m_bSignal )
  {
    VSignalFrame Nothing = i_rFrame;
    Nothing.m_Timecode.reset();
    o_rSlot.m_Frame.Begin( Nothing, rFormat, Black( rFormat ) );
    SetSilence( Nothing, o_rSlot.m_Frame.Sound() );
  }
  o_rSlot.m_PixelFormat = i_rDelivery.m_Video.m_PixelFormat;
  o_rSlot.m_SoundLayout = i_rDelivery.m_Audio.value_or( VSoundLayout() );
  o_rSlot.m_Times = { HardwareTimeOrigin + i_rFrame.m_Time, i_rDelivery.m_StreamTime, rFormat.m_pStandard->m_Period };
}

void VInput::Deliver( const VSignalFrame& i_rFrame )
{
  VDelivery Delivery;
  if( !PlanDelivery( i_rFrame, Delivery ) )
  {
    return;
  }
  const std::shared_ptr<VVirtualDeckLink> pCard = m_pCard.lock();
  VInputSlot* pSlot = m_pSlots->Take();
  if( !pSlot || !pCard )
  {
    if( pCard )
    {
      pCard->CountWithoutBuffer();
    }
    return;
  }
  FillSlot( i_rFrame, Delivery, *pSlot );
  pSlot->HandOut( m_pSlots );
  // The clip may have kept this waiting; a stop that has come meanwhile waits for the end of this flight.
  if( MayStillCall() )
  {
    const bool bAudio = Delivery.m_Audio && pSlot->m_Frame.Sound().Exists();
    const VCallbackCount Count;
    pCard->CountDelivered();
    ( *Delivery.m_pCallback )->VideoInputFrameArrived( &pSlot->Video(), bAudio ? &pSlot->Audio() : nullptr );
  }
  pSlot->GiveUp();
}

}
