#include "cards/common/TimecodeTrack.h"

#include <algorithm>
#include <array>

namespace VirtualCards
{

namespace
{

using KVZ::ITimecodeStandard;

struct VRate
{
  int64_t m_VideoPeriod;   // ticks of 1/135000000 s
  ITimecodeStandard::Enum m_Standard;
  ITimecodeStandard::Enum m_DropFrameStandard;   // ETimecodeNone where the rate has no drop-frame
  uint32_t m_FramesPerLabel;
};

constexpr std::array Rates = {
  VRate{ 5630625, ITimecodeStandard::ETimecode24Drift, ITimecodeStandard::ETimecodeNone, 1 },
  VRate{ 5625000, ITimecodeStandard::ETimecode24, ITimecodeStandard::ETimecodeNone, 1 },
  VRate{ 5400000, ITimecodeStandard::ETimecode25, ITimecodeStandard::ETimecodeNone, 1 },
  VRate{ 4504500, ITimecodeStandard::ETimecode30Drift, ITimecodeStandard::ETimecode30Drop, 1 },
  VRate{ 4500000, ITimecodeStandard::ETimecode30, ITimecodeStandard::ETimecodeNone, 1 },
  VRate{ 2812500, ITimecodeStandard::ETimecode24, ITimecodeStandard::ETimecodeNone, 2 },
  VRate{ 2700000, ITimecodeStandard::ETimecode25, ITimecodeStandard::ETimecodeNone, 2 },
  VRate{ 2252250, ITimecodeStandard::ETimecode30Drift, ITimecodeStandard::ETimecode30Drop, 2 },
  VRate{ 2250000, ITimecodeStandard::ETimecode30, ITimecodeStandard::ETimecodeNone, 2 },
};

const VRate* FindRate( int64_t i_VideoPeriod )
{
  const auto Found = std::find_if( Rates.begin(), Rates.end(), [&]( const VRate& i_r ) { return i_r.m_VideoPeriod == i_VideoPeriod; } );
  return Found != Rates.end() ? &*Found : nullptr;
}

int32_t StandardOf( const VRate& i_rRate, bool i_bDropFrame )
{
  const bool bDropFrame = i_bDropFrame && i_rRate.m_DropFrameStandard != ITimecodeStandard::ETimecodeNone;
  return bDropFrame ? i_rRate.m_DropFrameStandard : i_rRate.m_Standard;
}

KVZ::ITimecode ToTimecode( const VTimecodeLabel& i_rLabel, int32_t i_Standard )
{
  KVZ::ITimecode Timecode;
  Timecode.m_Standard = i_Standard;
  Timecode.m_Hours = i_rLabel.m_Hours;
  Timecode.m_Minutes = i_rLabel.m_Minutes;
  Timecode.m_Seconds = i_rLabel.m_Seconds;
  Timecode.m_Frames = i_rLabel.m_Frames;
  return Timecode;
}

bool ParseTwoDigits( std::string_view i_Text, uint8_t& o_rValue )
{
  const auto IsDigit = []( char i_Char ) { return i_Char >= '0' && i_Char <= '9'; };
  if( !IsDigit( i_Text[0] ) || !IsDigit( i_Text[1] ) )
  {
    return false;
  }
  o_rValue = static_cast<uint8_t>( ( i_Text[0] - '0' ) * 10 + i_Text[1] - '0' );
  return true;
}

}

std::optional<VTimecodeLabel> ParseTimecodeLabel( std::string_view i_Text )
{
  VTimecodeLabel Label;
  const bool bForm = i_Text.size() == 11 && i_Text[2] == ':' && i_Text[5] == ':' && ( i_Text[8] == ':' || i_Text[8] == ';' );
  if( !bForm || !ParseTwoDigits( i_Text.substr( 0, 2 ), Label.m_Hours ) || !ParseTwoDigits( i_Text.substr( 3, 2 ), Label.m_Minutes ) ||
    !ParseTwoDigits( i_Text.substr( 6, 2 ), Label.m_Seconds ) || !ParseTwoDigits( i_Text.substr( 9, 2 ), Label.m_Frames ) || Label.m_Hours > 23 ||
    Label.m_Minutes > 59 || Label.m_Seconds > 59 || Label.m_Frames > 29 )
  {
    return std::nullopt;
  }
  Label.m_bDropFrame = i_Text[8] == ';';
  return Label;
}

std::string WhyNotAt( const VTimecodeLabel& i_rLabel, int64_t i_VideoPeriod )
{
  const VRate* pRate = FindRate( i_VideoPeriod );
  if( !pRate )
  {
    return "this rate carries no timecode";
  }
  if( i_rLabel.m_bDropFrame && pRate->m_DropFrameStandard == ITimecodeStandard::ETimecodeNone )
  {
    return "drop-frame (\";\") exists only at 29.97 and 59.94 frames a second; accepted: HH:MM:SS:FF";
  }
  const int32_t Standard = StandardOf( *pRate, i_rLabel.m_bDropFrame );
  const int Nominal = KVZ::FindTimecodeStandard( Standard )->m_NominalFrames;
  if( i_rLabel.m_Frames >= Nominal )
  {
    return "frames count to " + std::to_string( Nominal - 1 ) + " at this rate; accepted: 00 to " + std::to_string( Nominal - 1 );
  }
  if( !KVZ::IsValid( ToTimecode( i_rLabel, Standard ) ) )
  {
    return "drop-frame leaves out frames 00 and 01 of every minute but each tenth; accepted there: 02 to 29";
  }
  return {};
}

void VTimecodeTrack::Start( const VTimecodeLabel& i_rLabel, int64_t i_VideoPeriod, uint64_t i_Frame )
{
  const VRate* pRate = FindRate( i_VideoPeriod );
  m_bRunning = pRate != nullptr;
  m_bDropFrame = i_rLabel.m_bDropFrame;
  if( pRate )
  {
    m_StartLabel = ToTimecode( i_rLabel, StandardOf( *pRate, m_bDropFrame ) );
    m_StartFrame = i_Frame;
    m_FramesPerLabel = pRate->m_FramesPerLabel;
  }
}

void VTimecodeTrack::ChangeRate( int64_t i_VideoPeriod, uint64_t i_Frame )
{
  const std::optional<VSignalTimecode> Reached = At( i_Frame );
  const VRate* pRate = FindRate( i_VideoPeriod );
  if( !Reached || !pRate )
  {
    m_bRunning = false;
    return;
  }
  const KVZ::ITimecode& rLabel = Reached->m_Label;
  KVZ::ITimecode Next = ToTimecode( { rLabel.m_Hours, rLabel.m_Minutes, rLabel.m_Seconds, rLabel.m_Frames, false },
    StandardOf( *pRate, m_bDropFrame ) );
  Next.m_Frames = std::min<uint8_t>( Next.m_Frames, KVZ::FindTimecodeStandard( Next.m_Standard )->m_NominalFrames - 1 );
  if( !KVZ::IsValid( Next ) )
  {
    Next.m_Frames = 2;   // a label that drop-frame leaves out
  }
  m_StartLabel = Next;
  m_StartFrame = i_Frame;
  m_FramesPerLabel = pRate->m_FramesPerLabel;
}

std::optional<VSignalTimecode> VTimecodeTrack::At( uint64_t i_Frame ) const
{
  if( !m_bRunning )
  {
    return std::nullopt;
  }
  const uint64_t Frames = i_Frame - m_StartFrame;
  VSignalTimecode Timecode{ m_StartLabel, Frames % m_FramesPerLabel != 0 };
  const int64_t Labels = static_cast<int64_t>( Frames / m_FramesPerLabel );
  KVZ::AddTicks( Timecode.m_Label, Labels * KVZ::FindTimecodeStandard( m_StartLabel.m_Standard )->m_Period );
  Timecode.m_Label.m_Days = 0;   // a signal knows nothing of days
  return Timecode;
}

}
