#include "cards/bluefish444/Input.h"

#include "cards/bluefish444/HancStream.h"
#include "cards/bluefish444/VideoModes.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

#include <algorithm>
#include <cstring>
#include <span>

namespace VirtualCards
{

namespace
{

namespace Property = BlueVelvet::Property;
namespace Buffer = BlueVelvet::Buffer;

constexpr boost::chrono::seconds MostPatience( 2 );

// Routing words: source, destination in the next byte, and the link type, single link, above.
constexpr std::array<uint32_t, BlueVelvet::MostInputs> Routings = { 0x30000F05, 0x30001006, 0x30001607, 0x30001708 };

// As another program may have left it.
constexpr uint32_t CaptureFifo = 2;

bool TakesImage( uint32_t i_Kind )
{
  return i_Kind == Buffer::Image || i_Kind == Buffer::ImageVbiHanc || i_Kind == Buffer::ImageVbi || i_Kind == Buffer::ImageHanc;
}

bool TakesHanc( uint32_t i_Kind ) { return i_Kind == Buffer::ImageVbiHanc || i_Kind == Buffer::Hanc || i_Kind == Buffer::ImageHanc; }

// Null for a buffer that was never filled.
void CopyHanc( const VCapturedFrame* i_pFrame, uint8_t* o_pTarget )
{
  if( i_pFrame )
  {
    EncodeHanc( i_pFrame->Signal(), i_pFrame->Sound(), o_pTarget );
    return;
  }
  std::memset( o_pTarget, 0, BlueVelvet::HancBytes );
}

// Behind the picture lies what else the card's memory holds.
void CopyImage( VCapturedFrame* i_pFrame, std::span<uint8_t> o_Target, uint64_t i_Offset )
{
  const uint64_t Held = i_pFrame ? i_pFrame->Format().Size() : 0;
  const uint64_t Picture = i_Offset < Held ? std::min<uint64_t>( Held - i_Offset, o_Target.size() ) : 0;
  if( Picture > 0 )
  {
    std::memcpy( o_Target.data(), i_pFrame->PictureBytes() + i_Offset, Picture );
  }
  std::memset( o_Target.data() + Picture, 0, o_Target.size() - Picture );
}

}

VBluefishInput::VBluefishInput( uint32_t i_Index, const VCardParts& i_rParts, const VPaceSettings& i_rSettings )
  : m_Index( i_Index ),
    m_Source( i_rParts.m_Source ),
    m_Properties{ { Property::VideoInputEngine, CaptureFifo }, { Property::VideoInputMemoryFormat, BlueVelvet::MemoryFormat::TwoVUY } },
    m_pStandard( KVZ::FindVideoStandard( i_rParts.m_Source.m_Standard ) ),
    m_LastToldMode( NoSignalMode ),
    m_Runner( i_rParts.Timeline(), i_rSettings, *this )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_bPresent = m_Runner.IsPresent();
}

VBluefishInput::~VBluefishInput() = default;

void VBluefishInput::Begin() { m_Runner.Start(); }

void VBluefishInput::End()
{
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bEnded = true;
  }
  m_Sync.notify_all();
  m_ClientWaits.notify_all();
  m_Source.m_pContent->Close();
  m_Runner.Stop();
}

VCardCounters VBluefishInput::Counters() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  VCardCounters Counters = m_Counters;
  Counters.m_ClientsWaiting = m_Waiting;
  Counters.m_FramesPassed = m_Runner.FramesPassed();
  Counters.m_FramesDropped = m_Runner.FramesDropped();
  return Counters;
}

bool VBluefishInput::Query( int i_Property, uint32_t& o_rValue )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !IsUsableLocked() )
  {
    return false;
  }
  if( i_Property == Property::VideoInputSignalVideoMode )
  {
    o_rValue = DetectedModeLocked();
    return true;
  }
  const auto Found = m_Properties.find( i_Property );
  o_rValue = Found != m_Properties.end() ? Found->second : o_rValue;
  return Found != m_Properties.end();
}

bool VBluefishInput::Set( int i_Property, uint32_t i_Value )
{
  const KVZ::IPixelFormat::Enum PixelFormat = PixelFormatOf( i_Value );
  bool bTaken = false;
  switch( i_Property )
  {
    case Property::VideoDualLinkInput: bTaken = i_Value == 0; break;
    case Property::VideoDualLinkInputSignalFormatType: bTaken = i_Value == BlueVelvet::SignalFormatIndependent422; break;
    case Property::VideoInputUpdateType: bTaken = i_Value <= BlueVelvet::UpdateMethod::Frame; break;
    case Property::VideoInputMemoryFormat: bTaken = PixelFormat != KVZ::IPixelFormat::EUnspecified; break;
    case Property::VideoInputEngine: bTaken = i_Value == BlueVelvet::VideoEngine::FrameStore; break;
    case Property::RoutingMatrix: bTaken = i_Value == Routing(); break;
    default: break;
  }
  VPictureFormat Format;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( !bTaken || !IsUsableLocked() )
    {
      return false;
    }
    m_Properties[i_Property] = i_Value;
    Format = { m_pStandard, PixelFormat };
  }
  if( i_Property == Property::VideoInputMemoryFormat )
  {
    m_Source.m_pContent->Prepare( Format );   // outside the lock: a clip takes its time
  }
  return true;
}

bool VBluefishInput::StopCapture()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Named = {};
  m_Filling = {};
  m_bInRound = false;
  m_ClientWaits.notify_all();
  return IsUsableLocked();
}

void VBluefishInput::Leave() { StopCapture(); }

bool VBluefishInput::WaitForSync( uint64_t& o_rFieldCount ) NO_LOCK_ANALYSIS
{
  boost::unique_lock<boost::mutex> Lock( m_Mutex );
  const uint64_t Seen = m_Syncs;
  ++m_Waiting;
  m_ClientWaits.notify_all();
  m_Sync.wait( Lock, [&]() NO_LOCK_ANALYSIS { return m_Syncs != Seen || !IsUsableLocked(); } );
  m_Waiting -= m_Syncs == Seen ? 1 : 0;   // a sync has taken all that waited for it along
  o_rFieldCount = m_FieldCount;
  return IsUsableLocked();
}

bool VBluefishInput::Capture( uint32_t i_BufferId )
{
  const uint32_t Number = i_BufferId & Buffer::NumberMask;
  const uint32_t Kind = i_BufferId & Buffer::KindMask;
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !IsUsableLocked() || !IsRoutedLocked() || Number >= BufferCount || i_BufferId > 0xFFFF || ( !TakesImage( Kind ) && !TakesHanc( Kind ) ) )
  {
    return false;
  }
  m_Named.m_Image = TakesImage( Kind ) ? std::optional( Number ) : m_Named.m_Image;
  m_Named.m_Hanc = TakesHanc( Kind ) ? std::optional( Number ) : m_Named.m_Hanc;
  return true;
}

bool VBluefishInput::Read( uint8_t* o_pTarget, uint64_t i_Size, uint32_t i_BufferId, uint64_t i_Offset )
{
  const uint32_t Data = i_BufferId & Buffer::DataMask;
  const bool bHanc = Data == Buffer::DataHanc;
  const bool bSensible = bHanc ? i_Size >= BlueVelvet::HancBytes && i_Offset == 0 : Data == Buffer::DataImage;
  if( !o_pTarget || ( i_BufferId & Buffer::NumberMask ) >= BufferCount || !bSensible )
  {
    return false;
  }
  VFramePointer pFrame;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( !IsUsableLocked() )
    {
      return false;
    }
    const VBuffer& rBuffer = m_Buffers[i_BufferId & Buffer::NumberMask];
    pFrame = bHanc ? rBuffer.m_pHanc : rBuffer.m_pImage;
    m_Counters.m_FramesDelivered += bHanc ? 0 : 1;
  }
  if( bHanc )
  {
    CopyHanc( pFrame.get(), o_pTarget );
  }
  else
  {
    CopyImage( pFrame.get(), { o_pTarget, i_Size }, i_Offset );
  }
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  pFrame.reset();   // with the lock held: whoever finds it free then finds it as it was left
  return true;
}

void VBluefishInput::OnPresence( bool i_bPresent )
{
  HoldForClient();
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bPresent = i_bPresent;
    m_bInRound = false;
  }
  m_Sync.notify_all();
  m_ClientWaits.notify_all();
}

void VBluefishInput::OnFrame( const VSignalFrame& i_rFrame )
{
  HoldForClient();
  VPictureFormat Format;
  VFramePointer pFrame;
  if( PlanFrame( i_rFrame, Format, pFrame ) && !( m_bShown = m_Source.m_pContent->Take( i_rFrame, Format, *pFrame ) ) )
  {
    pFrame.reset();
  }
  PassSync( i_rFrame, i_rFrame.m_bSignal && m_bShown, pFrame );
}

void VBluefishInput::HoldForClient() NO_LOCK_ANALYSIS
{
  boost::unique_lock<boost::mutex> Lock( m_Mutex );
  const auto IsBack = [this]() NO_LOCK_ANALYSIS { return !m_bInRound || m_Waiting > 0 || !IsUsableLocked(); };
  if( !m_ClientWaits.wait_for( Lock, MostPatience, IsBack ) )
  {
    m_bInRound = false;
    ++m_Counters.m_FramesWithoutBuffer;
  }
}

// False where this frame goes nowhere.
bool VBluefishInput::PlanFrame( const VSignalFrame& i_rFrame, VPictureFormat& o_rFormat, VFramePointer& o_rpFrame )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !i_rFrame.m_bSignal || ( !m_Filling.m_Image && !m_Filling.m_Hanc ) )
  {
    return false;
  }
  o_rFormat = { i_rFrame.m_pStandard, PixelFormatOf( m_Properties[Property::VideoInputMemoryFormat] ) };
  o_rpFrame = FreeFrameLocked();
  return true;
}

void VBluefishInput::PassSync( const VSignalFrame& i_rFrame, bool i_bSignal, const VFramePointer& i_pFrame )
{
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( i_pFrame && m_Filling.m_Image )
    {
      m_Buffers[*m_Filling.m_Image].m_pImage = i_pFrame;
    }
    if( i_pFrame && m_Filling.m_Hanc )
    {
      m_Buffers[*m_Filling.m_Hanc].m_pHanc = i_pFrame;
    }
    m_Filling = m_Named;
    m_bSignal = i_bSignal;
    m_pStandard = i_rFrame.m_pStandard;
    m_FieldCount = 2 * ( i_rFrame.m_Number + 1 );
    ++m_Syncs;
    m_bInRound = m_Waiting > 0 && ( i_bSignal || m_LastToldMode != NoSignalMode ) && ( m_Named.m_Image || m_Named.m_Hanc );
    m_Waiting = 0;
  }
  m_Sync.notify_all();
}

bool VBluefishInput::IsRoutedLocked() const
{
  const auto Routed = m_Properties.find( Property::RoutingMatrix );
  const auto Engine = m_Properties.find( Property::VideoInputEngine );
  return Routed != m_Properties.end() && Engine->second == BlueVelvet::VideoEngine::FrameStore;
}

uint32_t VBluefishInput::Routing() const { return Routings[m_Index]; }

uint32_t VBluefishInput::DetectedModeLocked()
{
  const uint32_t Mode = m_bSignal ? ModeOf( m_pStandard->m_Standard ) : NoSignalMode;
  m_Counters.m_FormatChanges += Mode != m_LastToldMode ? 1 : 0;
  m_LastToldMode = Mode;
  m_bInRound = m_bInRound && m_bSignal;
  m_ClientWaits.notify_all();
  return Mode;
}

VBluefishInput::VFramePointer VBluefishInput::FreeFrameLocked()
{
  const auto Free = std::find_if( m_Frames.begin(), m_Frames.end(), []( const VFramePointer& i_p ) { return i_p.use_count() == 1; } );
  if( Free != m_Frames.end() )
  {
    return *Free;
  }
  m_Frames.push_back( std::make_shared<VCapturedFrame>() );   // no more than the buffers hold and two that are on their way
  return m_Frames.back();
}

}
