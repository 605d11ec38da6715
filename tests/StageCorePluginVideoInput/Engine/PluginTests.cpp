#include "StageCorePluginVideoInput/StageCorePluginVideoInput.h"

#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCorePluginInterface/HardwareRegistry.h"
#include "host/StandAloneHost.h"
#include "tests/support/AssertionCapture.h"

#include <boost/algorithm/string/join.hpp>
#include <gtest/gtest.h>

namespace
{

using StageCorePluginInterface::IHardwareManager;

// Writes down what it is asked to show.
class VWrittenRegistry : public StageHost::VHardwareRegistry
{
public:
  void RegisterManager( std::shared_ptr<IHardwareManager> i_pManager ) override
  {
    m_Calls.push_back( "RegisterManager" );
    VHardwareRegistry::RegisterManager( std::move( i_pManager ) );
  }
  void SetSectionRoot( const std::string& i_rSection, const VDataPath& i_rPath ) override
  {
    m_Calls.push_back( "SetSectionRoot " + i_rSection + ": " + i_rPath.ToString() );
  }
  void AddSection( const std::string& i_rSection, VSectionPredicate i_Predicate, int i_SortPosition ) override
  {
    m_Predicate = std::move( i_Predicate );
    m_Calls.push_back( "AddSection " + i_rSection + ": " + std::to_string( i_SortPosition ) );
  }
  void AddCommand( const std::string& i_rKey, const std::vector<std::string>& i_rSections, const std::string& i_rText,
    const std::string& i_rShortcut ) override
  {
    m_Calls.push_back( "AddCommand " + i_rKey + " [" + boost::join( i_rSections, "][" ) + "] " + i_rText + " (" + i_rShortcut + ")" );
  }

  std::vector<std::string> m_Calls;
  VSectionPredicate m_Predicate;
};

class Plugin : public testing::Test
{
protected:
  StageHost::VStandAloneHost m_Host{ {} };
  const std::shared_ptr<VWrittenRegistry> m_pRegistry = std::make_shared<VWrittenRegistry>();
  StageHost::VHardwareHost m_Hardware{ m_pRegistry };
  std::unique_ptr<VStageCorePluginVideoInput> m_pPlugin = std::make_unique<VStageCorePluginVideoInput>();
};

TEST_F( Plugin, WithoutAnEngineEachRegistrationAssertsAndRegistersNothing )
{
  TestSupport::VAssertionCapture Assertions;
  EXPECT_FALSE( m_pPlugin->RegisterHardware( nullptr, m_Hardware ) );
  EXPECT_EQ( Assertions.Expressions(), ( std::vector<std::string>{ "m_pEngine != nullptr" } ) );
  EXPECT_TRUE( m_pRegistry->m_Calls.empty() );
  m_pPlugin->RegisterFlowNodeFactories( *m_Host.GetFlowNodeRegistry() );
  EXPECT_EQ( Assertions.Expressions().size(), 2u );
}

TEST_F( Plugin, RegistersItsFlowNodesTwiceAndItsHardwareInOrder )
{
  ASSERT_TRUE( m_pPlugin->Initialise( m_Host ) );
  EXPECT_EQ( m_Host.FlowNodes().Count(), 1u ) << "the engine's own";
  EXPECT_TRUE( m_pPlugin->RegisterFlowNodeFactories( *m_Host.GetFlowNodeRegistry() ) );
  EXPECT_EQ( m_Host.FlowNodes().Count(), 2u );
  EXPECT_NE( m_Host.FlowNodes().Find( "VideoInputDataSource" ), nullptr );
  EXPECT_TRUE( m_pPlugin->RegisterHardware( nullptr, m_Hardware ) );
  EXPECT_EQ( m_pRegistry->m_Calls,
    ( std::vector<std::string>{
      "RegisterManager",
      "AddSection Video Inputs: 30",
      "SetSectionRoot Video Inputs: VideoInput",
      "AddCommand Devices:SelectAllVideoInputs [Video Inputs] Select All Video Inputs (Alt+Shift+A)",
      "AddCommand Devices:SelectAllCameras [Video Inputs] Select All Cameras (Ctrl+Shift+A)",
    } ) );

  const VDataReader Reader( *m_Host.GetDataStore() );
  const auto& rIsOurs = m_pRegistry->m_Predicate;
  EXPECT_TRUE( rIsOurs( Reader, VDataPath{ "VideoInput" } ) );
  EXPECT_TRUE( rIsOurs( Reader, DeviceSchemas::Enabled( DeviceSchemas::VideoInput::Path( "vi:0" ) ) ) );
  EXPECT_FALSE( rIsOurs( Reader, VDataPath() ) );
  EXPECT_FALSE( rIsOurs( Reader, VDataPath{ "VideoInputs" } ) );
  EXPECT_FALSE( rIsOurs( Reader, VDataPath{ "Attributes", "VideoInput" } ) );
}

TEST_F( Plugin, ItsEngineLivesAsLongAsTheHostHoldsTheManagerOrAnotherReplacesIt )
{
  EXPECT_TRUE( m_pPlugin->Initialise( m_Host ) );
  const auto First = m_Host.Parameters().GetGroups();
  EXPECT_TRUE( m_pPlugin->Initialise( m_Host ) );
  EXPECT_EQ( m_Host.Parameters().GetGroups().size(), 1u );
  EXPECT_NE( m_Host.Parameters().GetGroups(), First );

  m_pPlugin->RegisterHardware( nullptr, m_Hardware );
  m_pPlugin.reset();
  EXPECT_EQ( m_Host.Parameters().GetGroups().size(), 1u );
  m_pRegistry->ReleaseManagers();
  EXPECT_TRUE( m_Host.Parameters().GetGroups().empty() );
}

}
