#include "host/DataStoreLock.h"

#include "StageCoreDataStore/DataVerifyWriter.h"
#include "host/DataStore.h"
#include "tests/support/Threads.h"

#include <gtest/gtest.h>

#include <atomic>
#include <future>

namespace
{

using EHeld = StageHost::VDataStoreLock::EHeld;

class DataStoreLock : public testing::Test
{
protected:
  EHeld Release()
  {
    return m_Lock.Release( [this] { ++m_LastReleases; } );
  }

  // Takes the lock on a thread of its own, and gives it back at End.
  class VOtherThread
  {
  public:
    VOtherThread( DataStoreLock& i_rTest, bool i_bExclusive )
      : m_Thread(
          [this, &i_rTest, i_bExclusive]
          {
            i_bExclusive ? (void)i_rTest.m_Lock.AcquireExclusive() : (void)i_rTest.m_Lock.AcquireShared();
            m_bTaken = true;
            m_Taken.set_value();
            m_End.get_future().wait();
            i_rTest.Release();
          } )
    {
    }
    bool HasTaken() const { return m_bTaken; }
    void WaitUntilTaken() { m_Taken.get_future().wait(); }
    void End()
    {
      m_End.set_value();
      m_Thread.join();
    }

  private:
    std::atomic<bool> m_bTaken{ false };
    std::promise<void> m_Taken;
    std::promise<void> m_End;
    boost::thread m_Thread;
  };

  // Returns when the writer waits for its turn, or has wrongly got it.
  void WaitUntilWaiting( const VOtherThread& i_rWriter )
  {
    TestSupport::WaitUntil( [&] { return m_Lock.WaitingWriters() != 0 || i_rWriter.HasTaken(); } );
    EXPECT_FALSE( i_rWriter.HasTaken() );
  }

  StageHost::VDataStoreLock m_Lock;
  std::atomic<int> m_LastReleases{ 0 };
};

}

TEST_F( DataStoreLock, NestsReadersButRefusesAWriterInsideThem )
{
  EXPECT_EQ( m_Lock.AcquireShared(), EHeld::Shared );
  EXPECT_EQ( m_Lock.AcquireShared(), EHeld::Shared );
  EXPECT_FALSE( m_Lock.AcquireExclusive() );
  EXPECT_EQ( Release(), EHeld::Shared );
  EXPECT_FALSE( m_Lock.AcquireExclusive() );
  EXPECT_EQ( Release(), EHeld::Shared );
  EXPECT_EQ( Release(), EHeld::None );
  EXPECT_TRUE( m_Lock.AcquireExclusive() );
  EXPECT_EQ( Release(), EHeld::Exclusive );
}

TEST_F( DataStoreLock, IsExclusiveUntilTheWritersLastNestedLockEndsInWhateverOrder )
{
  EXPECT_TRUE( m_Lock.AcquireExclusive() );
  EXPECT_EQ( m_Lock.AcquireShared(), EHeld::Exclusive );
  EXPECT_TRUE( m_Lock.AcquireExclusive() );
  VOtherThread Writer( *this, true );
  WaitUntilWaiting( Writer );
  Release();
  Release();
  EXPECT_EQ( m_LastReleases, 0 );
  EXPECT_EQ( m_Lock.HeldByThisThread(), EHeld::Exclusive );
  EXPECT_FALSE( Writer.HasTaken() );
  Release();
  EXPECT_EQ( m_Lock.HeldByThisThread(), EHeld::None );
  Writer.WaitUntilTaken();
  Writer.End();
  EXPECT_EQ( m_LastReleases, 2 );
}

TEST_F( DataStoreLock, AWriterWaitsForAllReadersAndLetsOnlyNestedOnesPass )
{
  m_Lock.AcquireShared();
  VOtherThread Reader( *this, false );
  Reader.WaitUntilTaken();
  VOtherThread Writer( *this, true );
  WaitUntilWaiting( Writer );
  EXPECT_EQ( m_Lock.AcquireShared(), EHeld::Shared );
  VOtherThread Newcomer( *this, false );
  Release();
  Release();
  WaitUntilWaiting( Writer );
  Reader.End();
  Writer.WaitUntilTaken();
  EXPECT_FALSE( Newcomer.HasTaken() );
  Writer.End();
  Newcomer.WaitUntilTaken();
  Newcomer.End();
  EXPECT_EQ( m_LastReleases, 1 );
}

TEST( DataStoreThreads, ReadersNeverSeeHalfAWrite )
{
  constexpr int Rounds = 2000;
  StageHost::VDataStore Store;
  const VDataPathHandle First( VDataPath{ "Pair", "First" } );
  const VDataPathHandle Second( VDataPath{ "Pair", "Second" } );
  std::atomic<int> Torn{ 0 };
  std::atomic<int> Heard{ 0 };
  VDataWriter( Store ).GetNode( VDataPath{ "Pair", "*" } )->OnValueChanged().AddImmediate( [&Heard] { ++Heard; } );

  const auto Write = [&]( int i_Offset )
  {
    for( int Round = 1; Round <= Rounds; ++Round )
    {
      const KVZ::Variant Value = KVZ::Variant::Make( Round * 2 + i_Offset );
      VDataWriter Outer( Store );
      Outer.SetValue( First, Value );
      VDataVerifyWriter( Store ).SetValue( Second, Value );
    }
  };
  const auto Read = [&]
  {
    for( int Round = 0; Round < Rounds; ++Round )
    {
      const VDataReader Reader( Store );
      const VDataReader Nested( Store );
      Torn += Reader.GetValue( First ) == Nested.GetValue( Second ) ? 0 : 1;
    }
  };
  TestSupport::RunOnThreads( 4, [&]( int i_Thread ) { i_Thread < 2 ? Write( i_Thread ) : Read(); } );
  EXPECT_EQ( Torn, 0 );
  EXPECT_EQ( Heard, 2 * Rounds );
}
