// Lets a card's frames pass: by the clock on a thread of its own, or by hand.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "cards/common/SignalTimeline.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <atomic>
#include <chrono>
#include <string>

namespace VirtualCards
{

// What passes goes here, on the card's thread; for a card stepped by hand that is the thread that steps.
class ICardFrames
{
public:
  virtual ~ICardFrames() = default;
  // The card comes into the machine or goes out of it, right before the frame of that number: it counts as being there, or as gone, once this has
  // returned. Not called for the state at the start.
  virtual void OnPresence( bool i_bPresent ) = 0;
  // Every frame that the card does not drop, while it is in the machine.
  virtual void OnFrame( const VSignalFrame& i_rFrame ) = 0;
};

using VPaceClock = std::chrono::steady_clock;

// When the signal's tick is due: one multiplication from the start, so nothing adds up.
VPaceClock::time_point DueTime( VPaceClock::time_point i_Start, int64_t i_Ticks, double i_Speed );

struct VPaceSettings
{
  double m_Speed = 1.0;          // real seconds pass this much faster for the card
  bool m_bManualClock = false;   // frames pass only when stepped
  std::string m_Name;            // of the thread
};

class VCardRunner
{
public:
  VCardRunner( VSignalTimeline i_Timeline, const VPaceSettings& i_rSettings, ICardFrames& i_rFrames );
  // Stops. Not on the card's thread.
  ~VCardRunner();

  // Frame 0 passes now, or at the first step.
  void Start();
  // No frame passes after this. Not on the card's thread, and with no lock held that a frame's receiver takes.
  void Stop();

  // Lets frames pass on this thread, one after the other. False for a card that runs by the clock, from inside a frame, and after Stop.
  bool Step( uint64_t i_Frames );

  // Before the next frame. Any thread.
  void Apply( const VCardEvent& i_rEvent );

  // Frames whose time has passed by now are not delivered any more; gives their number. For a receiver that made the card wait on purpose.
  uint64_t SkipToNow();

  // Any thread
  KVZ::IVideoStandard::Enum Standard() const;
  bool IsPresent() const;
  uint64_t FramesPassed() const;
  uint64_t FramesDropped() const { return m_Dropped; }
  bool IsCardThread() const;
  // Ticks since frame 0, between frames too where the clock runs.
  int64_t Now() const;

private:
  void Run();
  bool RunNext();
  void Pass( const VSignalFrame& i_rFrame );
  bool WaitUntil( VPaceClock::time_point i_Time );

  const VPaceSettings m_Settings;
  ICardFrames& m_rFrames;

  mutable boost::mutex m_Mutex;
  boost::condition_variable m_Wake;
  VSignalTimeline m_Timeline GUARDED_BY( m_Mutex );
  VPaceClock::time_point m_Start GUARDED_BY( m_Mutex );
  boost::thread::id m_CardThread GUARDED_BY( m_Mutex );
  bool m_bPresent GUARDED_BY( m_Mutex );
  bool m_bStopped GUARDED_BY( m_Mutex ) = false;

  boost::mutex m_StepMutex;   // one stepper at a time
  std::atomic<uint64_t> m_Dropped{ 0 };
  boost::thread m_Thread;
};

}
