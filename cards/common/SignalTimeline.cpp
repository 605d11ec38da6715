#include "cards/common/SignalTimeline.h"

#include "cards/common/SampleCadence.h"

#include <algorithm>
#include <limits>

namespace VirtualCards
{

namespace
{

constexpr uint64_t ForGood = std::numeric_limits<uint64_t>::max();

bool IsComingOrGoing( const VCardEvent& i_rEvent ) { return i_rEvent.m_Do == EEvent::Arrive || i_rEvent.m_Do == EEvent::Remove; }

}

VSignalTimeline::VSignalTimeline( KVZ::IVideoStandard::Enum i_Standard, const std::optional<VTimecodeLabel>& i_rTimecode,
  std::vector<VCardEvent> i_Events )
  : m_Events( i_Events.begin(), i_Events.end() ), m_pStandard( KVZ::FindVideoStandard( i_Standard ) )
{
  std::stable_sort( m_Events.begin(), m_Events.end(), []( const VCardEvent& i_rA, const VCardEvent& i_rB ) { return i_rA.m_Frame < i_rB.m_Frame; } );
  const auto First = std::find_if( m_Events.begin(), m_Events.end(), IsComingOrGoing );
  m_bPresent = First == m_Events.end() || First->m_Do == EEvent::Remove;
  if( i_rTimecode )
  {
    m_Timecode.Start( *i_rTimecode, m_pStandard->m_Period, 0 );
  }
}

VSignalFrame VSignalTimeline::Next()
{
  while( !m_Events.empty() && m_Events.front().m_Frame <= m_Number )
  {
    Apply( m_Events.front() );
    m_Events.pop_front();
  }

  const uint64_t Since = m_Number - m_StandardSince;
  const uint64_t Samples = SamplesUntil( Since, m_pStandard->m_Period );
  VSignalFrame Frame;
  Frame.m_Number = m_Number;
  Frame.m_pStandard = m_pStandard;
  Frame.m_Time = m_Time;
  Frame.m_bPresent = m_bPresent;
  Frame.m_bSignal = m_Number >= m_SignalLostUntil;
  Frame.m_bDropped = m_Number < m_DroppedUntil;
  Frame.m_LateMilliseconds = m_LateMilliseconds;
  Frame.m_FirstSample = m_SamplesBefore + Samples;
  Frame.m_Samples = static_cast<uint32_t>( SamplesUntil( Since + 1, m_pStandard->m_Period ) - Samples );
  if( Frame.m_bSignal && m_Number >= m_TimecodeLostUntil )
  {
    Frame.m_Timecode = m_Timecode.At( m_Number );
  }

  m_LateMilliseconds = 0;
  m_Time += m_pStandard->m_Period;
  ++m_Number;
  return Frame;
}

void VSignalTimeline::Apply( const VCardEvent& i_rEvent )
{
  switch( i_rEvent.m_Do )
  {
    case EEvent::SignalLoss: m_SignalLostUntil = m_Number + i_rEvent.m_Frames; break;
    case EEvent::Format: ChangeStandard( i_rEvent.m_Standard ); break;
    case EEvent::Drop: m_DroppedUntil = m_Number + i_rEvent.m_Frames; break;
    case EEvent::TimecodeJump:
      m_Timecode.Start( i_rEvent.m_To, m_pStandard->m_Period, m_Number );
      m_TimecodeLostUntil = 0;
      break;
    case EEvent::TimecodeLoss: m_TimecodeLostUntil = i_rEvent.m_Frames ? m_Number + i_rEvent.m_Frames : ForGood; break;
    case EEvent::Late: m_LateMilliseconds = i_rEvent.m_Milliseconds; break;
    case EEvent::Remove: m_bPresent = false; break;
    case EEvent::Arrive: m_bPresent = true; break;
  }
}

void VSignalTimeline::ChangeStandard( KVZ::IVideoStandard::Enum i_Standard )
{
  m_SamplesBefore += SamplesUntil( m_Number - m_StandardSince, m_pStandard->m_Period );
  m_StandardSince = m_Number;
  m_pStandard = KVZ::FindVideoStandard( i_Standard );
  m_Timecode.ChangeRate( m_pStandard->m_Period, m_Number );
}

}
