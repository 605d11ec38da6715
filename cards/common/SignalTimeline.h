// What is on the cable, frame by frame: the part of a signal that does not depend on its pictures and sounds.
#pragma once

#include "Core/VideoInterface/VideoStandard.h"
#include "cards/common/TimecodeTrack.h"

#include <cstdint>
#include <deque>
#include <optional>
#include <vector>

namespace VirtualCards
{

enum class EEvent
{
  SignalLoss,
  Format,
  Drop,
  TimecodeJump,
  TimecodeLoss,
  Late,
  Remove,
  Arrive
};

// Something that happens to a card before the frame of this number. Which fields count depends on what is done.
struct VCardEvent
{
  uint64_t m_Frame = 0;
  EEvent m_Do = EEvent::SignalLoss;
  uint64_t m_Frames = 0;   // signal-loss, drop: how many; timecode-loss: how many, 0 for good
  KVZ::IVideoStandard::Enum m_Standard = KVZ::IVideoStandard::EUnspecified;
  VTimecodeLabel m_To;
  uint32_t m_Milliseconds = 0;
};

struct VSignalFrame
{
  uint64_t m_Number = 0;   // the card's running frame number
  const KVZ::VVideoStandardRow* m_pStandard = nullptr;
  int64_t m_Time = 0;       // ticks of 1/135000000 s since frame 0
  bool m_bPresent = true;   // the card is in the machine
  bool m_bSignal = true;
  bool m_bDropped = false;   // the card fails to deliver this one
  uint32_t m_LateMilliseconds = 0;
  std::optional<VSignalTimecode> m_Timecode;
  uint64_t m_FirstSample = 0;   // of the running sample count
  uint32_t m_Samples = 0;
};

// A pure sequence: no clock, no threads. All is a function of the frame number, so dropped frames take their samples and labels along.
class VSignalTimeline
{
public:
  // Events in any order; those of one frame apply in their order here. A card whose first coming or going is an arrival is absent
  // until then.
  VSignalTimeline( KVZ::IVideoStandard::Enum i_Standard, const std::optional<VTimecodeLabel>& i_rTimecode, std::vector<VCardEvent> i_Events );

  VSignalFrame Next();

  // Before the next frame, whatever its number; the event's own is not looked at.
  void Apply( const VCardEvent& i_rEvent );

  uint64_t NextNumber() const { return m_Number; }
  int64_t NextTime() const { return m_Time; }
  bool IsPresent() const { return m_bPresent; }
  KVZ::IVideoStandard::Enum Standard() const { return m_pStandard->m_Standard; }

private:
  void ChangeStandard( KVZ::IVideoStandard::Enum i_Standard );

  std::deque<VCardEvent> m_Events;
  const KVZ::VVideoStandardRow* m_pStandard;
  VTimecodeTrack m_Timecode;

  uint64_t m_Number = 0;
  int64_t m_Time = 0;
  uint64_t m_StandardSince = 0;   // frame and sample at which the present standard began
  uint64_t m_SamplesBefore = 0;
  bool m_bPresent = true;
  uint64_t m_SignalLostUntil = 0;   // frame numbers
  uint64_t m_DroppedUntil = 0;
  uint64_t m_TimecodeLostUntil = 0;
  uint32_t m_LateMilliseconds = 0;   // of the next frame only
};

}
