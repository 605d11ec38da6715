// The timecode record and its arithmetic (SMPTE ST 12-1 labels, drop-frame included) in ticks of 1/135000000 s.
//
// Plain value, copied freely. Any thread may call these functions; the arithmetic neither allocates nor throws.
#pragma once

#include <cstdint>
#include <string>

namespace KVZ
{

class ITimecodeStandard
{
public:
  enum Enum : int32_t
  {
    ETimecodeNone = -1,
    ETimecode24 = 0,
    ETimecode24Drift = 1,   // counts 24, runs at 24000/1001
    ETimecode25 = 2,
    ETimecode30 = 3,
    ETimecode30Drift = 4,   // counts 30, runs at 30000/1001
    ETimecode30Drop = 5     // the same with drop-frame labels
  };
};

struct ITimecode
{
  int32_t m_Standard = ITimecodeStandard::ETimecodeNone;
  uint8_t m_Hours = 0;
  uint8_t m_Minutes = 0;
  uint8_t m_Seconds = 0;
  uint8_t m_Frames = 0;
  uint32_t m_UserBits = 0;
  int32_t m_Days = 0;              // whole days, signed
  uint32_t m_TickRemainder = 0;    // ticks past the start of this timecode frame
  uint32_t m_SubFramePeriod = 0;   // ticks between video frames, may be shorter than the timecode frame
};

// Equal in standard, the four counters, user bits, days and tick remainder; the sub-frame period does not count.
bool IsSameReading( const ITimecode& i_rA, const ITimecode& i_rB );

struct VTimecodeStandardRow
{
  int32_t m_Standard;
  const char* m_pLabel;      // "25 fps"
  uint8_t m_NominalFrames;   // what the frames field counts to
  uint32_t m_Period;         // ticks a timecode frame
  int64_t m_LabelsPerDay;    // before drop-frame labels are left out
  const char* m_pDescription;
};

// A null pointer for anything but the six standards.
const VTimecodeStandardRow* FindTimecodeStandard( int32_t i_Standard );

// A known standard, counters and remainder within their limits, and not one of the labels that drop-frame leaves out.
bool IsValid( const ITimecode& i_rTimecode );

// Ticks since midnight of day 0; 0 for an unknown standard.
int64_t ToTicks( const ITimecode& i_rTimecode );

// Fills counters, days and remainder; keeps standard, user bits and sub-frame period. False, with nothing changed, for an unknown standard.
bool FromTicks( ITimecode& io_rTimecode, int64_t i_Ticks );

// An invalid record stays as it is.
void AddTicks( ITimecode& io_rTimecode, int64_t i_Delta );

// 0 for an unknown standard.
int64_t GetTicksPerDay( const ITimecode& i_rTimecode );

// The label, or the long description; empty for an unknown standard.
std::string GetTimecodeStandardLabel( int32_t i_Standard, bool i_bLong );

// "01:02:03:04", or "01:02:03;04" in drop-frame; "none" for an invalid record.
std::string ToText( const ITimecode& i_rTimecode );

std::string ToName( ITimecodeStandard::Enum i_Value );
bool FromName( const std::string& i_rName, ITimecodeStandard::Enum& o_rValue );

}
