#include "StageCoreRuntime/Shared.h"
#include "StageCoreRuntime/ShutdownObject.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <stdexcept>

namespace
{
using VTrace = std::vector<std::string>;

class VTraced : public KVZ::VShared
{
public:
  VTraced( VTrace& i_rTrace, bool i_bFails = false ) : m_rTrace( i_rTrace ), m_bFails( i_bFails )
  {
    m_rTrace.push_back( KVZ::SharedFrom( this ) ? "constructed with owner" : "constructed without owner" );
  }
  void PostConstruct() override
  {
    m_rTrace.push_back( KVZ::SharedFrom( this ).get() == this ? "post-construct with owner" : "post-construct without owner" );
    if( m_bFails )
    {
      throw std::runtime_error( "no" );
    }
  }
  void PreDestruct() override { m_rTrace.push_back( KVZ::WeakFrom( this ).expired() ? "pre-destruct without owner" : "pre-destruct with owner" ); }
  ~VTraced() override { m_rTrace.push_back( "destroyed" ); }

private:
  VTrace& m_rTrace;
  const bool m_bFails;
};

static_assert( std::is_abstract_v<VTraced>, "objects are made by MakeShared alone" );

TEST( Shared, RunsItsHooksOnTheWholeObject )
{
  VTrace Trace;
  KVZ::MakeShared<VTraced>( Trace );
  EXPECT_EQ( Trace, ( VTrace{ "constructed without owner", "post-construct with owner", "pre-destruct without owner", "destroyed" } ) );
}

TEST( Shared, LeavesNothingBehindWhenPostConstructFails )
{
  VTrace Trace;
  EXPECT_THROW( KVZ::MakeShared<VTraced>( Trace, true ), std::runtime_error );
  EXPECT_EQ( Trace.back(), "destroyed" );
}

TEST( ShutdownObject, LeavesTheEndToTheLastOwnerAndNamesALateOne )
{
  const TestSupport::VLogCapture Capture( "Shutdown" );
  VTrace Trace;
  auto pObject = KVZ::MakeShared<VTraced>( Trace );
  std::unique_ptr<KVZ::Detail::IShutdownObject> pShutdown = std::make_unique<KVZ::Detail::VShutdownObject<VTraced>>( pObject, "Engine.cpp", 12 );
  pShutdown.reset();
  EXPECT_NE( Trace.back(), "destroyed" );
  EXPECT_TRUE( Capture.Has( "The object of Engine.cpp:12 has 1 other owners at its shutdown." ) );

  pShutdown = std::make_unique<KVZ::Detail::VShutdownObject<VTraced>>( pObject, "Engine.cpp", 12 );
  pObject.reset();
  EXPECT_EQ( Trace.back(), "destroyed" );
  pShutdown.reset();
  EXPECT_EQ( Capture.Texts().size(), 1u );
}
}
