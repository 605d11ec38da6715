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

TEST( HardwareStartEvent, FiresOnceForEachListenerHoweverLateAndNotForOneThatHasGone )
{
  VHardwareStartEvent Event;
  const auto pService = std::make_shared<VManualPostalService>();
  const auto pListener = std::make_shared<VListener>();
  auto pGone = std::make_shared<VListener>();
  const auto Here = NotificationSystem::BindWeak( pListener, &VListener::OnStart );
  const auto Gone = NotificationSystem::BindWeak( pGone, &VListener::OnStart );
  Event.Add( Gone, nullptr );
  Event.Add( Here, nullptr );
  pGone.reset();
  EXPECT_EQ( 0, pListener->m_Starts );
  Event.Fire();
  Event.Fire();
  EXPECT_EQ( 1, pListener->m_Starts );

  Event.Add( Gone, nullptr );
  Event.Add( Here, nullptr );
  EXPECT_EQ( 2, pListener->m_Starts );
  Event.Add( Gone, pService );
  Event.Add( Here, pService );
  EXPECT_EQ( 2, pListener->m_Starts );
  pService->RunAll();
  EXPECT_EQ( 3, pListener->m_Starts );
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
