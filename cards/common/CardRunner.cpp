#include "cards/common/CardRunner.h"

#include "StageCoreRuntime/DebugServices.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

namespace VirtualCards
{

namespace
{

// A receiver that is further behind than this loses frames, as with any card whose own memory is full.
constexpr std::chrono::seconds MostBehind( 2 );

}

VPaceClock::time_point DueTime( VPaceClock::time_point i_Start, int64_t i_Ticks, double i_Speed )
{
  // 1e9 / 135e6 nanoseconds a tick; long double holds years of them exactly
  const long double Nanoseconds = static_cast<long double>( i_Ticks ) * 200.0L / 27.0L / i_Speed;
  return i_Start + std::chrono::nanoseconds( static_cast<int64_t>( Nanoseconds ) );
}

VCardRunner::VCardRunner( VSignalTimeline i_Timeline, const VPaceSettings& i_rSettings, ICardFrames& i_rFrames )
  : m_Settings( i_rSettings ), m_rFrames( i_rFrames ), m_Timeline( std::move( i_Timeline ) ), m_bPresent( m_Timeline.IsPresent() )
{
}

VCardRunner::~VCardRunner() { Stop(); }

void VCardRunner::Start()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Start = VPaceClock::now();
  if( !m_Settings.m_bManualClock )
  {
    m_Thread = boost::thread( [this] { Run(); } );
    m_CardThread = m_Thread.get_id();
  }
}

void VCardRunner::Stop()
{
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bStopped = true;
  }
  m_Wake.notify_all();
  if( m_Thread.joinable() )
  {
    m_Thread.join();
  }
  const boost::lock_guard<boost::mutex> Stepper( m_StepMutex );   // a step that was under way has ended
}

bool VCardRunner::Step( uint64_t i_Frames )
{
  if( !m_Settings.m_bManualClock || IsCardThread() )
  {
    return false;
  }
  const boost::lock_guard<boost::mutex> Stepper( m_StepMutex );
  bool bPassed = true;
  for( uint64_t i = 0; i < i_Frames && bPassed; ++i )
  {
    VSignalFrame Frame;
    {
      const boost::lock_guard<boost::mutex> Lock( m_Mutex );
      bPassed = !m_bStopped;
      m_CardThread = boost::this_thread::get_id();
      Frame = bPassed ? m_Timeline.Next() : Frame;
    }
    if( bPassed )
    {
      Pass( Frame );
    }
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_CardThread = boost::thread::id();
  }
  return bPassed;
}

void VCardRunner::Apply( const VCardEvent& i_rEvent )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Timeline.Apply( i_rEvent );
}

uint64_t VCardRunner::SkipToNow()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const uint64_t First = m_Timeline.NextNumber();
  while( !m_Settings.m_bManualClock && DueTime( m_Start, m_Timeline.NextTime(), m_Settings.m_Speed ) < VPaceClock::now() )
  {
    m_Timeline.Next();
  }
  return m_Timeline.NextNumber() - First;
}

KVZ::IVideoStandard::Enum VCardRunner::Standard() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_Timeline.Standard();
}

bool VCardRunner::IsPresent() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_bPresent;
}

uint64_t VCardRunner::FramesPassed() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_Timeline.NextNumber();
}

bool VCardRunner::IsCardThread() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_CardThread == boost::this_thread::get_id();
}

int64_t VCardRunner::Now() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_Settings.m_bManualClock )
  {
    return m_Timeline.NextTime();
  }
  const auto Elapsed = std::chrono::duration_cast<std::chrono::nanoseconds>( VPaceClock::now() - m_Start ).count();
  return static_cast<int64_t>( static_cast<long double>( Elapsed ) * 27.0L / 200.0L * m_Settings.m_Speed );
}

void VCardRunner::Run()
{
  const DebugServices::VCrashHandlerForThread CrashHandler;
  DebugServices::SetThreadName( m_Settings.m_Name );
  while( RunNext() )
  {
  }
}

bool VCardRunner::RunNext()
{
  VPaceClock::time_point Due;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Due = DueTime( m_Start, m_Timeline.NextTime(), m_Settings.m_Speed );
  }
  if( !WaitUntil( Due ) )
  {
    return false;
  }
  VSignalFrame Frame;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Frame = m_Timeline.Next();
  }
  if( VPaceClock::now() > Due + MostBehind && Frame.m_bPresent )
  {
    Frame.m_bDropped = true;
  }
  if( Frame.m_LateMilliseconds > 0 && !WaitUntil( Due + std::chrono::milliseconds( Frame.m_LateMilliseconds ) ) )
  {
    return false;
  }
  Pass( Frame );
  return true;
}

void VCardRunner::Pass( const VSignalFrame& i_rFrame )
{
  bool bChanged = false;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    bChanged = m_bPresent != i_rFrame.m_bPresent;
  }
  if( bChanged )
  {
    m_rFrames.OnPresence( i_rFrame.m_bPresent );
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bPresent = i_rFrame.m_bPresent;
  }
  if( i_rFrame.m_bPresent && i_rFrame.m_bDropped )
  {
    ++m_Dropped;
  }
  else if( i_rFrame.m_bPresent )
  {
    m_rFrames.OnFrame( i_rFrame );
  }
}

// False when the card stops first.
bool VCardRunner::WaitUntil( VPaceClock::time_point i_Time ) NO_LOCK_ANALYSIS
{
  boost::unique_lock<boost::mutex> Lock( m_Mutex );
  while( !m_bStopped )
  {
    const auto Left = std::chrono::duration_cast<std::chrono::nanoseconds>( i_Time - VPaceClock::now() ).count();
    if( Left <= 0 )
    {
      return true;
    }
    m_Wake.wait_for( Lock, boost::chrono::nanoseconds( Left ) );
  }
  return false;
}

}
