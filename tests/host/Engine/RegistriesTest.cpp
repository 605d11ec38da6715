#include "host/Registries.h"

#include "NotificationSystem/WeakBinder.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

using namespace StageHost;
using TestSupport::VManualPostalService;

namespace
{

struct VListener
{
  void OnStart() { ++m_Starts; }
  int m_Starts = 0;
};

class VNamedObject : public KVZ::Detail::IShutdownObject
{
public:
  VNamedObject( std::vector<std::string>& o_rEnded, std::string i_Name ) : m_rEnded( o_rEnded ), m_Name( std::move( i_Name ) ) {}
  ~VNamedObject() override { m_rEnded.push_back( m_Name ); }

private:
  std::vector<std::string>& m_rEnded;
  const std::string m_Name;
};

}

TEST( HardwareStartEvent, FiresOnceForEachListenerHoweverLateItComes )
{
  VHardwareStartEvent Event;
  const auto pService = std::make_shared<VManualPostalService>();
  const auto pEarly = std::make_shared<VListener>();
  const auto pLate = std::make_shared<VListener>();
  Event.Add( NotificationSystem::BindWeak( pEarly, &VListener::OnStart ), nullptr );
  EXPECT_EQ( 0, pEarly->m_Starts );
  Event.Fire();
  Event.Fire();
  EXPECT_EQ( 1, pEarly->m_Starts );

  Event.Add( NotificationSystem::BindWeak( pLate, &VListener::OnStart ), nullptr );
  EXPECT_EQ( 1, pLate->m_Starts );
  Event.Add( NotificationSystem::BindWeak( pLate, &VListener::OnStart ), pService );
  EXPECT_EQ( 1, pLate->m_Starts );
  pService->RunAll();
  EXPECT_EQ( 2, pLate->m_Starts );
}

TEST( HardwareStartEvent, AListenerThatHasGoneIsNoFailure )
{
  VHardwareStartEvent Event;
  const auto pService = std::make_shared<VManualPostalService>();
  auto pListener = std::make_shared<VListener>();
  Event.Add( NotificationSystem::BindWeak( pListener, &VListener::OnStart ), nullptr );
  const auto Late = NotificationSystem::BindWeak( pListener, &VListener::OnStart );
  pListener.reset();
  EXPECT_NO_THROW( Event.Fire() );
  EXPECT_NO_THROW( Event.Add( Late, nullptr ) );
  EXPECT_NO_THROW( Event.Add( Late, pService ) );
  EXPECT_NO_THROW( pService->RunAll() );
}

TEST( ShutdownManager, DestroysTheNewestFirst )
{
  std::vector<std::string> Ended;
  VShutdownManager Manager;
  for( const char* pName : { "manager", "parameters", "engine" } )
  {
    Manager.AddShutdownObject( std::make_unique<VNamedObject>( Ended, pName ) );
  }
  Manager.Shutdown();
  EXPECT_EQ( ( std::vector<std::string>{ "engine", "parameters", "manager" } ), Ended );
}
