#include "Core/VideoInterface/Timecode.h"

#include "Core/VideoInterface/Schemas.h"

#include <array>
#include <cstdio>
#include <tuple>

namespace KVZ
{

namespace
{

constexpr std::array Standards = {
  VTimecodeStandardRow{ ITimecodeStandard::ETimecode24, "24 fps", 24, 5625000, 2073600, "24 fps timecode (Sometimes referred to as 'FILM')" },
  VTimecodeStandardRow{ ITimecodeStandard::ETimecode24Drift, "23.98 fps", 24, 5630625, 2073600,
    "23.98 fps timecode (Counts 24 frames to a second but with an underlying frame rate of 23.98Hz - sometimes referred to as 'NTSC compatible "
    "FILM')" },
  VTimecodeStandardRow{ ITimecodeStandard::ETimecode25, "25 fps", 25, 5400000, 2160000, "25 fps timecode (Sometimes referred to as 'PAL')" },
  VTimecodeStandardRow{ ITimecodeStandard::ETimecode30, "30 fps", 30, 4500000, 2592000,
    "30 fps timecode (Runs at a true underlying frame rate of 30Hz)" },
  VTimecodeStandardRow{ ITimecodeStandard::ETimecode30Drift, "29.97 fps", 30, 4504500, 2592000,
    "29.97 fps timecode (Counts 30 frames to a second but with an underlying frame rate of 29.97Hz - sometimes referred to as 'NTSC')" },
  VTimecodeStandardRow{ ITimecodeStandard::ETimecode30Drop, "29.97 fps DF", 30, 4504500, 2592000,
    "29.97 fps drop frame timecode (Counts 30 frames to a second, with drop frame corrections, at an underlying frame rate of 29.97Hz - "
    "sometimes referred to as 'Drop Frame NTSC')" },
};
static_assert( Standards.size() == 6 );

constexpr std::array Rows = {
  VEnumRow{ ITimecodeStandard::ETimecodeNone, "TimecodeNone", "Invalid value representing no timecode standard" },
  VEnumRow{ ITimecodeStandard::ETimecode24, "Timecode24", "24 fps (FILM)" },
  VEnumRow{ ITimecodeStandard::ETimecode24Drift, "Timecode24Drift",
    "24 fps but actually running at (24/1.001)fps - hence drifting from wall clock (NTSC compatible FILM)" },
  VEnumRow{ ITimecodeStandard::ETimecode25, "Timecode25", "25 fps (PAL)" },
  VEnumRow{ ITimecodeStandard::ETimecode30, "Timecode30", "30 fps" },
  VEnumRow{ ITimecodeStandard::ETimecode30Drift, "Timecode30Drift",
    "30 fps but actually running at (30/1.001)fps hence drifting from wall clock (NTSC)" },
  VEnumRow{ ITimecodeStandard::ETimecode30Drop, "Timecode30Drop",
    "30 fps but actually running at (30/1.001)fps with periodic correction to wall clock (NTSC Drop) [still drifts very slightly!]" },
};

constexpr VEnumTable Table{ "ETimecodeStandard", "Supported timecode standards.", Rows };

// Drop-frame leaves out labels 0 and 1 of every minute but each tenth (SMPTE ST 12-1).
int64_t LabelsToFrames( int64_t i_Labels ) { return i_Labels + 2 * ( i_Labels / 18000 ) - 2 * ( i_Labels / 1800 ); }

int64_t FramesToLabels( int64_t i_Frames )
{
  const int64_t Labels = i_Frames + 2 * ( ( i_Frames - 2 * ( ( i_Frames - 2 ) / 17982 ) - 2 ) / 1798 );
  return Labels - 2 * ( Labels / 18002 );
}

bool IsDropFrame( int32_t i_Standard ) { return i_Standard == ITimecodeStandard::ETimecode30Drop; }

int64_t TicksPerDay( const VTimecodeStandardRow& i_rRow )
{
  const int64_t Frames = IsDropFrame( i_rRow.m_Standard ) ? LabelsToFrames( i_rRow.m_LabelsPerDay ) : i_rRow.m_LabelsPerDay;
  return Frames * i_rRow.m_Period;
}

// Days come from files, where they can be anything: wraps instead of overflowing.
int64_t AddWrapped( int64_t i_Ticks, int64_t i_Factor, int64_t i_Delta )
{
  return static_cast<int64_t>( static_cast<uint64_t>( i_Ticks ) + static_cast<uint64_t>( i_Factor ) * static_cast<uint64_t>( i_Delta ) );
}

}

const VEnumTable& GetEnumTable( ITimecodeStandard::Enum ) { return Table; }

bool IsSameReading( const ITimecode& i_rA, const ITimecode& i_rB )
{
  const auto Reading = []( const ITimecode& i_r )
  { return std::tie( i_r.m_Standard, i_r.m_Hours, i_r.m_Minutes, i_r.m_Seconds, i_r.m_Frames, i_r.m_UserBits, i_r.m_Days, i_r.m_TickRemainder ); };
  return Reading( i_rA ) == Reading( i_rB );
}

const VTimecodeStandardRow* FindTimecodeStandard( int32_t i_Standard )
{
  const bool bKnown = i_Standard >= 0 && i_Standard < static_cast<int32_t>( Standards.size() );
  return bKnown ? &Standards[i_Standard] : nullptr;
}

bool IsValid( const ITimecode& i_rTimecode )
{
  const VTimecodeStandardRow* pRow = FindTimecodeStandard( i_rTimecode.m_Standard );
  if( !pRow || i_rTimecode.m_Hours >= 24 || i_rTimecode.m_Minutes >= 60 || i_rTimecode.m_Seconds >= 60 ||
    i_rTimecode.m_Frames >= pRow->m_NominalFrames || i_rTimecode.m_TickRemainder >= pRow->m_Period )
  {
    return false;
  }
  const bool bMinuteThatDrops = IsDropFrame( i_rTimecode.m_Standard ) && i_rTimecode.m_Seconds == 0 && i_rTimecode.m_Minutes % 10 != 0;
  return !bMinuteThatDrops || i_rTimecode.m_Frames > 1;
}

int64_t ToTicks( const ITimecode& i_rTimecode )
{
  const VTimecodeStandardRow* pRow = FindTimecodeStandard( i_rTimecode.m_Standard );
  if( !pRow )
  {
    return 0;
  }
  const int64_t Seconds = ( i_rTimecode.m_Hours * 60 + i_rTimecode.m_Minutes ) * 60 + i_rTimecode.m_Seconds;
  const int64_t Labels = Seconds * pRow->m_NominalFrames + i_rTimecode.m_Frames;
  const int64_t Frames = IsDropFrame( i_rTimecode.m_Standard ) ? LabelsToFrames( Labels ) : Labels;
  return AddWrapped( Frames * pRow->m_Period + i_rTimecode.m_TickRemainder, i_rTimecode.m_Days, TicksPerDay( *pRow ) );
}

bool FromTicks( ITimecode& io_rTimecode, int64_t i_Ticks )
{
  const VTimecodeStandardRow* pRow = FindTimecodeStandard( io_rTimecode.m_Standard );
  if( !pRow )
  {
    return false;
  }
  const int64_t Day = TicksPerDay( *pRow );
  const bool bBelowDay = i_Ticks % Day < 0;
  const int64_t Ticks = bBelowDay ? i_Ticks % Day + Day : i_Ticks % Day;
  const int64_t Frames = Ticks / pRow->m_Period;
  const int64_t Labels = IsDropFrame( io_rTimecode.m_Standard ) ? FramesToLabels( Frames ) : Frames;
  const int64_t Seconds = Labels / pRow->m_NominalFrames;

  io_rTimecode.m_Days = static_cast<int32_t>( i_Ticks / Day - ( bBelowDay ? 1 : 0 ) );
  io_rTimecode.m_TickRemainder = static_cast<uint32_t>( Ticks - Frames * pRow->m_Period );
  io_rTimecode.m_Frames = static_cast<uint8_t>( Labels % pRow->m_NominalFrames );
  io_rTimecode.m_Seconds = static_cast<uint8_t>( Seconds % 60 );
  io_rTimecode.m_Minutes = static_cast<uint8_t>( Seconds / 60 % 60 );
  io_rTimecode.m_Hours = static_cast<uint8_t>( Seconds / 3600 );
  return true;
}

void AddTicks( ITimecode& io_rTimecode, int64_t i_Delta )
{
  if( IsValid( io_rTimecode ) )
  {
    FromTicks( io_rTimecode, AddWrapped( ToTicks( io_rTimecode ), 1, i_Delta ) );
  }
}

int64_t GetTicksPerDay( const ITimecode& i_rTimecode )
{
  const VTimecodeStandardRow* pRow = FindTimecodeStandard( i_rTimecode.m_Standard );
  return pRow ? TicksPerDay( *pRow ) : 0;
}

std::string GetTimecodeStandardLabel( int32_t i_Standard, bool i_bLong )
{
  const VTimecodeStandardRow* pRow = FindTimecodeStandard( i_Standard );
  if( !pRow )
  {
    return {};
  }
  return i_bLong ? pRow->m_pDescription : pRow->m_pLabel;
}

std::string ToText( const ITimecode& i_rTimecode )
{
  if( !IsValid( i_rTimecode ) )
  {
    return "none";
  }
  const char Separator = IsDropFrame( i_rTimecode.m_Standard ) ? ';' : ':';
  std::array<char, 24> Text{};
  std::snprintf( Text.data(), Text.size(), "%02u:%02u:%02u%c%02u", i_rTimecode.m_Hours, i_rTimecode.m_Minutes, i_rTimecode.m_Seconds, Separator,
    i_rTimecode.m_Frames );
  return Text.data();
}

std::string ToName( ITimecodeStandard::Enum i_Value ) { return FindName( Table, i_Value ); }

bool FromName( const std::string& i_rName, ITimecodeStandard::Enum& o_rValue ) { return FindEnumerator( Table, i_rName, o_rValue ); }

}
