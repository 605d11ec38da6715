#include "HardwareSupport/VideoInput/VideoInputDataSource/FrameWorkers.h"

#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>
#include <boost/thread/mutex.hpp>

#include <deque>
#include <utility>

namespace VideoInputHAL
{

class VFrameWorkers::VState
{
public:
  explicit VState( std::function<void()> i_OnDone ) : m_OnDone( std::move( i_OnDone ) ) {}

  size_t Pending() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Queue.size() + m_Running + m_Done.size();
  }

  void Add( size_t i_File, VJob i_Job )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Queue.push_back( { i_File, std::move( i_Job ) } );
  }

  // Runs the oldest job, if it has not been dropped.
  void RunNext()
  {
    VQueued Next;
    if( !Begin( Next ) )
    {
      return;
    }
    VFrameOutcome Outcome = Next.m_Job();
    Next.m_Job = nullptr;   // lets go of the frame
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Done.push_back( { Next.m_File, std::move( Outcome ) } );
      --m_Running;
      m_Ended.notify_all();
    }
    m_OnDone();
  }

  std::vector<VDone> TakeDone()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return std::exchange( m_Done, {} );
  }

  void DropAndWait() NO_LOCK_ANALYSIS
  {
    std::deque<VQueued> Dropped;   // ends without the lock
    boost::unique_lock<boost::mutex> Lock( m_Mutex );
    Dropped.swap( m_Queue );
    while( m_Running != 0 )
    {
      m_Ended.wait( Lock );
    }
  }

private:
  struct VQueued
  {
    size_t m_File = 0;
    VJob m_Job{};
  };

  bool Begin( VQueued& o_rNext )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_Queue.empty() )
    {
      return false;
    }
    o_rNext = std::move( m_Queue.front() );
    m_Queue.pop_front();
    ++m_Running;
    return true;
  }

  const std::function<void()> m_OnDone;
  mutable boost::mutex m_Mutex;
  boost::condition_variable m_Ended;
  std::deque<VQueued> m_Queue GUARDED_BY( m_Mutex );
  size_t m_Running GUARDED_BY( m_Mutex ) = 0;
  std::vector<VDone> m_Done GUARDED_BY( m_Mutex );
};

VFrameWorkers::VFrameWorkers( std::shared_ptr<KVZ::IPostalService> i_pService, size_t i_Room, std::function<void()> i_OnDone )
  : m_pService( std::move( i_pService ) ), m_Room( i_Room ), m_pState( std::make_shared<VState>( std::move( i_OnDone ) ) )
{
}

VFrameWorkers::~VFrameWorkers() { DropAndWait(); }

bool VFrameWorkers::HasRoom() const { return m_pState->Pending() < m_Room; }

bool VFrameWorkers::IsIdle() const { return m_pState->Pending() == 0; }

void VFrameWorkers::Add( size_t i_File, VJob i_Job )
{
  m_pState->Add( i_File, std::move( i_Job ) );
  m_pService->Post( [pState = m_pState] { pState->RunNext(); } );
}

std::vector<VFrameWorkers::VDone> VFrameWorkers::TakeDone() { return m_pState->TakeDone(); }

void VFrameWorkers::DropAndWait() { m_pState->DropAndWait(); }

}
