#include "SyncSystem/DataSource.h"

#include "NotificationSystem/WeakBinder.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/uuid/random_generator.hpp>
#include <boost/uuid/uuid.hpp>

#include <cstring>
#include <utility>

namespace SyncSystem
{

using KVZ::VTick;

namespace
{

uint64_t MakeSourceId()
{
  const boost::uuids::uuid Random = boost::uuids::random_generator()();
  uint64_t Id = 0;
  std::memcpy( &Id, Random.data, sizeof( Id ) );
  return Id == 0 ? 1 : Id;   // 0 means a clock that sources share
}

std::shared_ptr<VStrand> MakeStrand( std::shared_ptr<KVZ::IPostalService> i_pService )
{
  return i_pService ? std::make_shared<VStrand>( std::move( i_pService ) ) : nullptr;
}

std::shared_ptr<VTimeBasedCaptureBuffer> MakeBuffer( const VDataSourceSettings& i_rSettings, const std::shared_ptr<VStrand>& i_pStrand )
{
  return VTimeBasedCaptureBuffer::Make( { .m_Name = i_rSettings.m_Name,
    .m_pAllocator = i_rSettings.m_pAllocator,
    .m_DeleteFrame = i_rSettings.m_DeleteFrame,
    .m_pPostalService = i_pStrand } );
}

}

VDataSource::VDataSource( const VDataSourceSettings& i_rSettings )
  : m_Name( i_rSettings.m_Name ),
    m_rLog( KVZ::LogCategory( "Hal." + i_rSettings.m_Name ) ),
    m_SourceId( MakeSourceId() ),
    m_NoticeSeconds( i_rSettings.m_NoticeSeconds ),
    m_CounterClock( KVZ::IClock::CounterFromSessionStart, 0, m_SourceId ),
    m_pStrand( MakeStrand( i_rSettings.m_pPostalService ) ),
    m_pBuffer( MakeBuffer( i_rSettings, m_pStrand ) ),
    m_pDrift( std::make_shared<VTimingMonitor>( Drift::VDriftMonitorConfiguration(), Drift::VDriftMonitorFilteredConfiguration() ) ),
    m_pAnalysis( i_rSettings.m_pAnalysis ),
    m_Reader( m_pBuffer, m_rLog ),
    m_OnRequestNewGlobal( m_pStrand ),
    m_OnNewFrames( m_pStrand )
{
}

VDataSource::~VDataSource() = default;

void VDataSource::PostConstruct()
{
  m_pBuffer->Allocator().SetRecoveryFinished(
    [pWeak = KVZ::WeakFrom( this )]
    {
      if( const auto pThis = pWeak.lock() )
      {
        pThis->OnMemoryExhausted();
      }
    } );
  // Without a strand these would come with the buffer's lock held.
  if( m_pStrand )
  {
    const auto Refresh = []( VDataSource& i_rThis, const auto&... ) { i_rThis.GetCaptureStatus(); };
    m_pBuffer->StatusCallback().Add( NotificationSystem::BindWeak( KVZ::WeakFrom( this ), Refresh ), m_pStrand );
    m_pBuffer->CaptureReadyCallback().Add( NotificationSystem::BindWeak( KVZ::WeakFrom( this ), Refresh ), m_pStrand );
  }
}

bool VDataSource::AddFrame( const VIncomingFrame& i_rFrame, size_t i_PayloadSize, const std::function<bool( void* )>& i_rFillPayload )
{
  uint32_t SessionBefore = 0;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    SessionBefore = m_Session.m_Id;
  }
  if( IsDrainingAfterExhaustion() )
  {
    m_RefusedFrames.fetch_add( 1, std::memory_order_relaxed );
    return false;
  }
  VFrameEntry* pEntry = m_pBuffer->NewEntry( i_PayloadSize );
  if( !pEntry )
  {
    return false;   // OnMemoryExhausted has seen to it
  }
  if( !i_rFillPayload( Payload( pEntry ) ) )
  {
    m_pBuffer->DiscardEntry( pEntry );
    return false;
  }
  if( i_rFrame.m_pMemory )
  {
    m_pBuffer->Allocator().LinkBlocks( i_rFrame.m_pMemory, pEntry );
  }
  Store( pEntry, i_rFrame, SessionBefore );
  WakeReader();
  return true;
}

void VDataSource::Store( VFrameEntry* i_pEntry, const VIncomingFrame& i_rFrame, uint32_t i_SessionBefore )
{
  VFrameTiming Timing;
  Timing.m_Clocks = i_rFrame.m_Clocks;
  Timing.m_Period = i_rFrame.m_Period;
  Timing.m_CounterClock = m_CounterClock;
  Timing.m_BeatPeriod = i_rFrame.m_BeatPeriod;
  Timing.m_BeatOffset = i_rFrame.m_BeatOffset;
  uint32_t SessionId = 0;
  m_pBuffer->AddFrame( i_pEntry, Timing, SessionId );
  if( SessionId != i_SessionBefore )
  {
    OnNewSyncSession( SessionId );
  }
  if( i_rFrame.m_Now != 0.0 )
  {
    TimeFrame( i_rFrame, SessionId, Timing.m_Clocks.Find( m_CounterClock ) );
  }
}

void VDataSource::TimeFrame( const VIncomingFrame& i_rFrame, uint32_t i_SessionId, VTick i_Counter )
{
  const int64_t Period = i_rFrame.m_Period.Count();
  const auto Frame = static_cast<uint64_t>( i_Counter.Count() / Period );
  m_pDrift->Update( i_SessionId, VTick::TicksPerSecond, static_cast<uint32_t>( Period ), 0, Frame, i_rFrame.m_Now );
  VDeliveryOffsets Offsets;
  if( m_pAnalysis && m_pDrift->GetOffsets( i_SessionId, Frame, i_rFrame.m_Now, Offsets ) )
  {
    m_pAnalysis->Publish( Offsets );
  }
}

void VDataSource::OnNewSyncSession( uint32_t i_SessionId )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    TakeSession( i_SessionId );
  }
  KVZ_LOG( m_rLog, 5, "AddFrame: Frame forced new local sync session %1% - will request new global sync session", i_SessionId );
  RequestNewGlobalSyncSession();
}

// A buffer that has just been drained would otherwise fill again during the rest of the same capture.
bool VDataSource::IsDrainingAfterExhaustion()
{
  if( !m_ExhaustedCapture.IsValid() )
  {
    return false;
  }
  VCaptureSessionStatus Status;
  if( m_pBuffer->Status( Status ) && Status.m_CaptureSessionId == m_ExhaustedCapture && ( Status.m_State & ECaptureState::NothingToProtect ) == 0 )
  {
    return true;
  }
  m_ExhaustedCapture = {};
  return false;
}

// The newest frame's place, also where that frame has been evicted already; before the session's first frame when it has none.
VToken VDataSource::NewestPosition() const
{
  VToken Position = m_pBuffer->GetNextToken();
  --Position.m_FrameNumber;
  return Position;
}

// Delivery thread, from inside an allocation: a frame's data or its entry cannot be had, and eviction could not help. Frames of a device that
// finds no memory never arrive here, and its frame count does not show them: the next frame must not seem to follow the last one.
void VDataSource::OnMemoryExhausted()
{
  m_RefusedFrames.fetch_add( 1, std::memory_order_relaxed );
  VCaptureSessionStatus Status;
  if( m_pBuffer->Status( Status ) && ( Status.m_State & ECaptureState::NothingToProtect ) == 0 )
  {
    m_ExhaustedCapture = Status.m_CaptureSessionId;
    VCaptureEnd End;
    End.m_Failure = ECaptureFailure::MemoryExhausted;
    End.m_bRequested = false;
    End.m_End = NewestPosition();
    m_pBuffer->SetCaptureEnd( Status.m_CaptureSessionId, End );
  }
  m_pBuffer->RequestNewBufferSession();
}

void VDataSource::WakeReader()
{
  uint64_t Token = 0;
  {
    boost::lock_guard<boost::mutex> Lock( m_WakeMutex );
    Token = std::exchange( m_WakeToken, 0 );
  }
  if( Token != 0 )
  {
    m_OnNewFrames( Token );
  }
}

EReadResult::Enum VDataSource::ReadFrames( uint64_t i_MaxFrames, VReadFrames& o_rRead )
{
  return m_Reader.Read( NewestInfo(), i_MaxFrames, o_rRead );
}

EReadResult::Enum VDataSource::ReadFramesOrSleep( uint64_t i_MaxFrames, uint64_t i_WakeToken, VReadFrames& o_rRead )
{
  if( ReadFrames( i_MaxFrames, o_rRead ) == EReadResult::Frames )
  {
    return EReadResult::Frames;
  }
  {
    boost::lock_guard<boost::mutex> Lock( m_WakeMutex );
    m_WakeToken = i_WakeToken;
  }
  // A frame that came just before the token was left wakes nobody.
  if( ReadFrames( i_MaxFrames, o_rRead ) == EReadResult::Frames )
  {
    TakeBackToken( i_WakeToken );
    return EReadResult::Frames;
  }
  return EReadResult::Asleep;
}

void VDataSource::TakeBackToken( uint64_t i_WakeToken )
{
  boost::lock_guard<boost::mutex> Lock( m_WakeMutex );
  m_WakeToken = m_WakeToken == i_WakeToken ? 0 : m_WakeToken;
}

void VDataSource::PostToStrand( std::function<void()> i_Function )
{
  if( m_pStrand )
  {
    m_pStrand->Post( std::move( i_Function ) );
  }
  else
  {
    i_Function();
  }
}

}
