// A source, two writers, a browser and somebody who starts, ends and cancels captures, each on a thread of its own and with too little memory.
#include "SyncSystem/CaptureBuffer.h"

#include "NotificationSystem/AsioPostalService.h"
#include "tests/support/FrameMemory.h"

#include <gtest/gtest.h>

#include <atomic>
#include <map>
#include <memory>
#include <random>
#include <set>
#include <thread>
#include <vector>

namespace
{

using namespace SyncSystem;
using KVZ::VCaptureSessionId;
using TestSupport::NumberedPayload;

struct VRange
{
  int64_t m_First = 0;
  int64_t m_Last = 0;
  bool m_bGapless = true;
  bool m_bCancelled = false;
};

// Reads on its own thread whenever it is notified.
class VWriter
{
public:
  explicit VWriter( VCaptureBuffer& i_rBuffer )
    : m_rBuffer( i_rBuffer ), m_Id( i_rBuffer.RegisterClient( [this] { m_Service.Post( [this] { Run(); } ); } ) )
  {
  }

  void Stop()
  {
    m_rBuffer.UnregisterClient( m_Id );
    m_Service.Stop();
  }

  VRange RangeOf( uint32_t i_Capture )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Ranges[i_Capture];
  }

  std::atomic<size_t> m_Wrong{ 0 };

private:
  void Run()
  {
    EClientResult::Enum Result = EClientResult::MoreToCome;
    while( Result == EClientResult::MoreToCome || Result == EClientResult::Finished ) Result = ReadOne();
  }

  EClientResult::Enum ReadOne()
  {
    VRefCountedToken Frame;
    VClientRead Read;
    if( !m_rBuffer.ClientNextFrame( m_Id, Frame, Read ) ) return EClientResult::NoFrameYet;
    if( Frame ) Take( Frame, Read.m_CaptureSessionId.Value() );
    if( Read.m_Result == EClientResult::Cancelled )
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Ranges[Read.m_CaptureSessionId.Value()].m_bCancelled = true;
    }
    return Read.m_Result;
  }

  void Take( const VRefCountedToken& i_rFrame, uint32_t i_Capture )
  {
    const int64_t Number = i_rFrame.Token().m_FrameNumber;
    if( !NumberedPayload( i_rFrame.Frame() ).Holds( Number ) ) ++m_Wrong;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    VRange& rRange = m_Ranges[i_Capture];
    if( rRange.m_First == 0 ) rRange.m_First = Number;
    if( rRange.m_Last != 0 && rRange.m_Last + 1 != Number ) rRange.m_bGapless = false;
    rRange.m_Last = Number;
  }

  VCaptureBuffer& m_rBuffer;
  boost::mutex m_Mutex;
  std::map<uint32_t, VRange> m_Ranges GUARDED_BY( m_Mutex );
  NotificationSystem::VAsioPostalService m_Service{ "Writer" };
  const uint32_t m_Id;
};

class VStress
{
public:
  static constexpr uint32_t Captures = 300;

  void Run()
  {
    std::thread Source( [this] { AddFrames(); } );
    std::thread Browser( [this] { Browse(); } );
    std::thread Neighbour( [this] { TakeMemory(); } );
    for( uint32_t Capture = 1; Capture <= Captures; ++Capture ) RunCapture( Capture );
    m_bStop = true;
    for( std::thread* pThread : { &Source, &Browser, &Neighbour } ) pThread->join();
    m_First.Stop();
    m_Second.Stop();
  }

  void Check()
  {
    EXPECT_EQ( m_First.m_Wrong + m_Second.m_Wrong + m_BrowsedWrong, 0u );
    EXPECT_GT( m_Completed, 0u );
    size_t Told = 0;
    for( uint32_t Capture = 1; Capture <= Captures; ++Capture )
    {
      const bool bTold = m_First.RangeOf( Capture ).m_bCancelled || m_Second.RangeOf( Capture ).m_bCancelled;
      EXPECT_TRUE( !bTold || m_Cancelled.count( Capture ) );
      Told += bTold ? 1 : 0;
    }
    EXPECT_GT( Told, 0u );
    EXPECT_GT( m_Browsed, 0u );
    EXPECT_GT( m_Added, 0 );
  }

private:
  // As a device delivers: a frame that finds no memory ends the capture.
  void AddFrames()
  {
    while( !m_bStop )
    {
      if( m_pBuffer->Add().IsValid() )
      {
        ++m_Added;
        continue;
      }
      VCaptureSessionStatus Status;
      VToken Newest;
      if( m_pBuffer->Status( Status ) && m_pBuffer->GetNewestToken( Newest ) )
        m_pBuffer->SetCaptureEnd( Status.m_CaptureSessionId, { Newest, ECaptureFailure::MemoryExhausted } );
      std::this_thread::yield();
    }
  }

  // As a live reader does: walks behind the live edge with frames pinned.
  void Browse()
  {
    VToken Position;
    std::vector<VRefCountedToken> Pinned( 3 );
    for( size_t Turn = 0; !m_bStop; ++Turn )
    {
      VRefCountedToken& rPinned = Pinned[Turn % Pinned.size()];
      m_pBuffer->Advance( Position, 1 );
      if( !m_pBuffer->Read( Position, rPinned ) )
      {
        if( !m_pBuffer->GetFirstToken( m_pBuffer->GetCurrentBufferSession(), Position ) ) std::this_thread::yield();
        continue;
      }
      ++m_Browsed;
      for( const VRefCountedToken& rFrame : Pinned )
      {
        if( rFrame && !NumberedPayload( rFrame.Frame() ).Holds( rFrame.Token().m_FrameNumber ) ) ++m_BrowsedWrong;
      }
    }
  }

  // As another device of the same host does: it takes blocks and gives them up again.
  void TakeMemory()
  {
    const auto pClient = m_Memory.m_pPool->MakeClient();
    std::vector<void*> Blocks;
    while( !m_bStop )
    {
      void* pBlock = Blocks.size() < 4 ? pClient->Allocate( 1 ) : nullptr;
      if( pBlock ) Blocks.push_back( pBlock );
      if( pBlock ) continue;
      for( void* pTaken : Blocks ) pClient->Free( pTaken );
      Blocks.clear();
      std::this_thread::yield();
    }
    for( void* pTaken : Blocks ) pClient->Free( pTaken );
  }

  void RunCapture( uint32_t i_Id )
  {
    VCaptureRequest Request;
    Request.m_Id = VCaptureSessionId( i_Id );
    Request.m_Start = m_pBuffer->GetNextToken();
    Request.m_Start.m_FrameNumber += static_cast<int64_t>( Pick( 60 ) ) - 30;
    if( Pick( 2 ) == 0 )
      Request.m_End = { Request.m_Start.m_BufferSession, Request.m_Start.m_FrameNumber + 1 + static_cast<int64_t>( Pick( 60 ) ), nullptr };
    ASSERT_TRUE( m_pBuffer->StartCapture( Request ) );
    const size_t Action = Pick( 4 );
    const int64_t Until = m_Added + static_cast<int64_t>( Pick( 80 ) );
    while( m_Added < Until && !IsOver() ) std::this_thread::yield();
    if( Action == 0 ) m_pBuffer->CancelCapture( Request.m_Id );
    if( Action == 1 ) m_pBuffer->StartNewBufferSession();
    while( !IsOver() )
    {
      // An end that lies behind the live edge ends it there.
      m_pBuffer->SetCaptureEnd( Request.m_Id, { Request.m_Start } );
      std::this_thread::yield();
    }
    CheckCapture( i_Id );
  }

  bool IsOver() const
  {
    VCaptureSessionStatus Status;
    m_pBuffer->Status( Status );
    return ( Status.m_State & ( ECaptureState::Idle | ECaptureState::Complete | ECaptureState::Cancelled ) ) != 0;
  }

  // When a capture is over all clients have left it, so what they noted is complete.
  void CheckCapture( uint32_t i_Id )
  {
    VCaptureSessionStatus Status;
    ASSERT_TRUE( m_pBuffer->Status( Status ) );
    ASSERT_EQ( Status.m_CaptureSessionId.Value(), i_Id );
    const bool bComplete = Status.m_State == ECaptureState::Complete;
    m_Completed += bComplete ? 1 : 0;
    if( Status.m_State == ECaptureState::Cancelled ) m_Cancelled.insert( i_Id );
    for( VWriter* pWriter : { &m_First, &m_Second } )
    {
      const VRange Range = pWriter->RangeOf( i_Id );
      ASSERT_TRUE( Range.m_bGapless );
      if( Range.m_First != 0 || bComplete )
      {
        ASSERT_EQ( Range.m_First, Status.m_Start.m_FrameNumber );
      }
      if( bComplete )
      {
        ASSERT_EQ( Range.m_Last, Status.m_End.m_FrameNumber );
        ASSERT_EQ( Status.m_CapturedFrames, static_cast<uint64_t>( Range.m_Last - Range.m_First + 1 ) );
      }
    }
  }

  size_t Pick( size_t i_Bound ) { return std::uniform_int_distribution<size_t>( 0, i_Bound - 1 )( m_Random ); }

  std::mt19937 m_Random{ 1 };
  TestSupport::VFrameMemory m_Memory{ 20, 4 };
  std::shared_ptr<TestSupport::VNumberedCaptureBuffer> m_pBuffer = VCaptureBuffer::Make<TestSupport::VNumberedCaptureBuffer>(
    TestSupport::VNumberedCaptureBuffer::Settings( m_Memory ) );
  VWriter m_First{ *m_pBuffer };
  VWriter m_Second{ *m_pBuffer };
  std::atomic<bool> m_bStop{ false };
  std::atomic<int64_t> m_Added{ 0 };
  std::atomic<size_t> m_Browsed{ 0 };
  std::atomic<size_t> m_BrowsedWrong{ 0 };
  size_t m_Completed = 0;
  std::set<uint32_t> m_Cancelled;
};

TEST( CaptureBufferThreads, EveryClientGetsExactlyTheRangeOfEveryCapture )
{
  VStress Stress;
  Stress.Run();
  Stress.Check();
}

}
