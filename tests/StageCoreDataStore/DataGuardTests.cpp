#include "StageCoreDataStore/DataVerifyWriter.h"
#include "host/DataStore.h"
#include "tests/support/AssertionCapture.h"

#include <gtest/gtest.h>

namespace
{

const std::vector<std::string> FatalWrite = { "!\"Fatal attempt to acquire a write lock from within a read lock.\"" };

class GuardedStore : public testing::Test
{
protected:
  // Whether this thread holds the exclusive lock.
  bool IsWriting()
  {
    uint32_t State = 0;
    m_Store.AcquireReadLock( State );
    m_Store.ReleaseReadLock();
    return State == 2;
  }

  StageHost::VDataStore m_Store;
  const VDataPath m_Path{ "A", "B" };
  TestSupport::VAssertionCapture m_Assertions;
};

}

TEST_F( GuardedStore, AMovedGuardKeepsItsLockUntilItsLastOwnerEnds )
{
  VDataWriter Writer( m_Store );
  {
    VDataWriter Owner( std::move( Writer ) );
    EXPECT_TRUE( Owner.SetValue( m_Path, KVZ::Variant::Make( 1 ) ) );
    VDataVerifyWriter VerifyWriter( m_Store );
    const VDataVerifyWriter VerifyOwner( std::move( VerifyWriter ) );
    VDataReader Reader( m_Store );
    const VDataReader ReaderOwner( std::move( Reader ) );
    VDataVerifyReader VerifyReader( m_Store );
    const VDataVerifyReader VerifyReaderOwner( std::move( VerifyReader ) );
    EXPECT_TRUE( IsWriting() );
  }
  EXPECT_FALSE( IsWriting() );
  EXPECT_TRUE( m_Assertions.Expressions().empty() );
}

TEST_F( GuardedStore, AMovedFromGuardFindsAndStoresNothing )
{
  const auto pWriter = std::make_unique<VDataVerifyWriter>( m_Store );
  EXPECT_TRUE( pWriter->SetValue( m_Path, KVZ::Variant::Make( 1 ) ) );
  const VDataVerifyWriter Owner( std::move( *pWriter ) );

  KVZ::Variant Value;
  EXPECT_FALSE( pWriter->Exists( m_Path ) );
  EXPECT_FALSE( pWriter->GetVerifiedValue( m_Path, Value ) );
  EXPECT_FALSE( pWriter->SetVerifiedValue( m_Path, KVZ::Variant::Make( 2 ) ) );
  EXPECT_EQ( pWriter->GetNode( m_Path ), nullptr );
  EXPECT_TRUE( m_Assertions.Expressions().empty() );
  EXPECT_EQ( pWriter->GetDataStore(), nullptr );
  EXPECT_EQ( m_Assertions.Expressions(), std::vector<std::string>{ "m_pDataStore != nullptr" } );
  EXPECT_EQ( Owner.GetDataStore(), &m_Store );
}

TEST_F( GuardedStore, AWriterInsideAReaderIsAnAssertionAndStoresNothing )
{
  VDataWriter( m_Store ).SetValue( m_Path, KVZ::Variant::Make( 1 ) );
  {
    const VDataReader Reader( m_Store );
    VDataWriter Writer( m_Store );
    EXPECT_EQ( m_Assertions.Expressions(), FatalWrite );
    EXPECT_FALSE( Writer.SetValue( m_Path, KVZ::Variant::Make( 2 ) ) );
    EXPECT_EQ( Reader.GetValue( m_Path ), KVZ::Variant::Make( 1 ) );
  }
  EXPECT_TRUE( VDataWriter( m_Store ).SetValue( m_Path, KVZ::Variant::Make( 3 ) ) );
  EXPECT_EQ( m_Assertions.Expressions(), FatalWrite );
}
