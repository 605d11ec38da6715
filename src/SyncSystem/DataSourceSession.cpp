#include "SyncSystem/DataSourceSession.h"

#include "StageCoreRuntime/DebugServices.h"

#include <algorithm>

namespace SyncSystem
{

using KVZ::IClock;
using KVZ::VTick;

namespace
{

int64_t DivideUp( int64_t i_Value, int64_t i_By ) { return i_Value / i_By + ( i_Value % i_By > 0 ? 1 : 0 ); }

}

VTick VGlobalSyncSessionInfo::LiveStart() const { return m_StartTicks.Find( IClock( IClock::GlobalTime, 0, 0 ) ); }

bool VGlobalSyncSessionInfo::Start( const KVZ::ITickInClocks& i_rTicks, VTick i_Offset )
{
  if( m_Session.m_StartTime.IsEmpty() ||
    !KVZ_ASSERT( m_Session.m_StartTime.m_TickByClock.rbegin()->first.Type() == KVZ::IClock::CounterFromSessionStart ) )
  {
    return false;
  }
  const VTick Global = i_rTicks.Find( IClock( IClock::GlobalTime, 0, 0 ) );
  const VTick Counter = i_rTicks.Find( m_Session.m_StartTime.m_TickByClock.rbegin()->first );
  if( !Global.IsValid() || !Counter.IsValid() )
  {
    return false;
  }
  m_bStarted = true;
  m_StartTicks = i_rTicks;
  m_Offset = i_Offset;
  m_CounterStart = Global - Counter;
  TakeTimecode( Counter );
  return true;
}

// The source's own clock tells which standard is its own: the readings may hold those of other sources.
void VGlobalSyncSessionInfo::TakeTimecode( VTick i_Counter )
{
  m_Timecode = KVZ::ITimecode();
  m_OffsetTimecodeFrames = 0;
  const auto& rClocks = m_Session.m_StartTime.m_TickByClock;
  const auto Shared = std::find_if( rClocks.begin(), rClocks.end(),
    []( const auto& i_rEntry ) { return i_rEntry.first.Type() == IClock::Timecode && i_rEntry.first.Source() == 0; } );
  const VTick Reading = Shared == rClocks.end() ? VTick::Invalid() : m_StartTicks.Find( Shared->first );
  const KVZ::VTimecodeStandardRow* pRow = Reading.IsValid() ? KVZ::FindTimecodeStandard( Shared->first.Index() - 1 ) : nullptr;
  if( !pRow )
  {
    return;
  }
  m_Timecode.m_Standard = pRow->m_Standard;
  KVZ::FromTicks( m_Timecode, ( Reading - i_Counter ).Count() );
  m_OffsetTimecodeFrames = static_cast<int32_t>( m_Offset.Count() / pRow->m_Period );
}

VToken VGlobalSyncSessionInfo::PositionAtOrAfter( VTick i_Global ) const
{
  const int64_t Frames = DivideUp( ( i_Global - m_CounterStart ).Count(), m_Session.m_Period.Count() );
  return { m_Record.m_First.m_BufferSession, m_Record.m_First.m_FrameNumber + Frames, nullptr };
}

bool VGlobalSyncSessionInfo::TickAt( const VToken& i_rPosition, VTick& o_rGlobal ) const
{
  int64_t Frames = 0;
  if( !VCaptureBuffer::Distance( m_Record.m_First, i_rPosition, Frames ) )
  {
    return false;
  }
  o_rGlobal = m_CounterStart + m_Session.m_Period * Frames;
  return true;
}

KVZ::ITimecode VGlobalSyncSessionInfo::TimecodeAt( VTick i_Global ) const
{
  KVZ::ITimecode Timecode = m_Timecode;
  KVZ::AddTicks( Timecode, ( i_Global - m_CounterStart ).Count() );
  return Timecode;
}

}
