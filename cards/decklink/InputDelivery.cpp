// What an input does on the card's thread: tells its client of formats and hands it frames.
#include "cards/decklink/Input.h"

#include "cards/decklink/VirtualDeckLink.h"

#include <boost/thread/lock_guard.hpp>

#include <atomic>

namespace VirtualCards
{

using namespace DeckLinkAPI;

namespace
{

std::atomic<int32_t> g_CallbacksInFlight{ 0 };

bool IsRGB( uint32_t i_Format ) { return i_Format == PixelFormat::BGRA8Bit; }

// Counts a running callback.
struct VCallbackCount
{
  VCallbackCount() { ++g_CallbacksInFlight; }
  ~VCallbackCount() { --g_CallbacksInFlight; }
};

}

int32_t CallbacksInFlight() { return g_CallbacksInFlight; }

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

bool VInput::IsInFlightHere() const { return m_bInFlight && m_FlightThread == boost::this_thread::get_id(); }

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
