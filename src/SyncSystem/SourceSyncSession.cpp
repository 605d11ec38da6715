#include "SyncSystem/SourceSyncSession.h"

namespace KVZ
{

namespace
{

constexpr const char* NotCorresponding = "Clock continuity information does not correspond to clock start times";

const char* ValidateNumbers( const ISourceSyncSession& i_rSession )
{
  if( i_rSession.m_Id == 0 ) return "Invalid Id";
  if( i_rSession.m_Period < VTick( 1 ) ) return "Period must be a positive number of ticks";
  if( i_rSession.m_BeatPeriod < VTick( 0 ) ) return "Beat period cannot be a negative number of ticks";
  if( i_rSession.m_NoticePeriod < VTick( 0 ) ) return "Notice period for starting new global sync session cannot be a negative number of ticks";
  if( i_rSession.m_StartTime.IsEmpty() ) return "No clocks specified";
  if( i_rSession.m_StartTime.m_TickByClock.size() != i_rSession.m_ContinuousSince.size() ) return NotCorresponding;
  return "";
}

const char* ValidateCounter( const ISourceSyncSession& i_rSession, VTick i_Start, uint32_t i_ContinuousSince, bool i_bSeen )
{
  if( i_bSeen ) return "Multiple counter from session start clocks are not permitted";
  if( i_Start != VTick( 0 ) ) return "Counter from session start clock should always have a start tick of zero";
  if( i_ContinuousSince != i_rSession.m_Id )
    return "Counter from session start clocks should never be continuous from a previous source sync session";
  return "";
}

const char* ValidateClocks( const ISourceSyncSession& i_rSession )
{
  bool bCounterSeen = false;
  auto Continuity = i_rSession.m_ContinuousSince.begin();
  for( const auto& [Clock, Start] : i_rSession.m_StartTime.m_TickByClock )
  {
    const auto& [ContinuousClock, ContinuousSince] = *Continuity++;
    if( !( Clock == ContinuousClock ) ) return NotCorresponding;
    if( Clock.Type() == IClock::GlobalTime ) return "Source sync sessions cannot refer to the global time clocks";
    if( Clock.Type() != IClock::CounterFromSessionStart ) continue;
    const char* pFailure = ValidateCounter( i_rSession, Start, ContinuousSince, bCounterSeen );
    if( *pFailure ) return pFailure;
    bCounterSeen = true;
  }
  return bCounterSeen ? "" : "A counter from session start clock must be provided";
}

}

std::string ISourceSyncSession::Validate() const
{
  const char* pFailure = ValidateNumbers( *this );
  return *pFailure ? pFailure : ValidateClocks( *this );
}

}
