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
using StageHost::VStandAloneHost;

// Writes down each call with its arguments.
class VWrittenRegistry : public StageCorePluginInterface::IHardwareRegistry
{
public:
  void RegisterManager( std::shared_ptr<IHardwareManager> i_pManager ) override
  {
    m_pManager = i_pManager;
    m_Calls.push_back( "RegisterManager" );
  }
  void UnregisterManager( const std::shared_ptr<IHardwareManager>& ) override { m_Calls.push_back( "UnregisterManager" ); }
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
  std::shared_ptr<IHardwareManager> m_pManager;
  VSectionPredicate m_Predicate;
};

class VWrittenHardware : public StageCorePluginInterface::IHardwareHost
{
public:
  std::shared_ptr<StageCorePluginInterface::IHardwareRegistry> GetHardwareRegistry() override { return m_pRegistry; }
  const std::shared_ptr<VWrittenRegistry> m_pRegistry = std::make_shared<VWrittenRegistry>();
};

TEST( Plugin, WithoutAnEngineEachRegistrationAssertsAndRegistersNothing )
{
  VStandAloneHost Host( {} );
  VWrittenHardware Hardware;
  TestSupport::VAssertionCapture Assertions;
  VStageCorePluginVideoInput Plugin;
  EXPECT_FALSE( Plugin.RegisterHardware( nullptr, Hardware ) );
  EXPECT_EQ( Assertions.Expressions(), ( std::vector<std::string>{ "m_pEngine != nullptr" } ) );
  EXPECT_TRUE( Hardware.m_pRegistry->m_Calls.empty() );
  Plugin.RegisterFlowNodeFactories( *Host.GetFlowNodeRegistry() );
  EXPECT_EQ( Assertions.Expressions().size(), 2u );
}

TEST( Plugin, RegistersItsFlowNodesTwiceAndItsHardwareInOrder )
{
  VStandAloneHost Host( {} );
  VWrittenHardware Hardware;
  VStageCorePluginVideoInput Plugin;
  ASSERT_TRUE( Plugin.Initialise( Host ) );
  EXPECT_EQ( Host.FlowNodes().Count(), 1u ) << "the engine's own";
  EXPECT_TRUE( Plugin.RegisterFlowNodeFactories( *Host.GetFlowNodeRegistry() ) );
  EXPECT_EQ( Host.FlowNodes().Count(), 2u );
  EXPECT_NE( Host.FlowNodes().Find( "VideoInputDataSource" ), nullptr );
  EXPECT_TRUE( Plugin.RegisterHardware( nullptr, Hardware ) );
  EXPECT_EQ( Hardware.m_pRegistry->m_Calls,
    ( std::vector<std::string>{
      "RegisterManager",
      "AddSection Video Inputs: 30",
      "SetSectionRoot Video Inputs: VideoInput",
      "AddCommand Devices:SelectAllVideoInputs [Video Inputs] Select All Video Inputs (Alt+Shift+A)",
      "AddCommand Devices:SelectAllCameras [Video Inputs] Select All Cameras (Ctrl+Shift+A)",
    } ) );

  const VDataReader Reader( *Host.GetDataStore() );
  const auto& rIsOurs = Hardware.m_pRegistry->m_Predicate;
  EXPECT_TRUE( rIsOurs( Reader, VDataPath{ "VideoInput" } ) );
  EXPECT_TRUE( rIsOurs( Reader, DeviceSchemas::Enabled( DeviceSchemas::VideoInput::Path( "vi:0" ) ) ) );
  EXPECT_FALSE( rIsOurs( Reader, VDataPath() ) );
  EXPECT_FALSE( rIsOurs( Reader, VDataPath{ "VideoInputs" } ) );
  EXPECT_FALSE( rIsOurs( Reader, VDataPath{ "Attributes", "VideoInput" } ) );
}

TEST( Plugin, ItsEngineLivesAsLongAsTheHostHoldsTheManagerOrAnotherReplacesIt )
{
  VStandAloneHost Host( {} );
  VWrittenHardware Hardware;
  auto pPlugin = std::make_unique<VStageCorePluginVideoInput>();
  EXPECT_TRUE( pPlugin->Initialise( Host ) );
  const auto First = Host.Parameters().GetGroups();
  EXPECT_TRUE( pPlugin->Initialise( Host ) );
  EXPECT_EQ( Host.Parameters().GetGroups().size(), 1u );
  EXPECT_NE( Host.Parameters().GetGroups(), First );

  pPlugin->RegisterHardware( nullptr, Hardware );
  pPlugin.reset();
  EXPECT_EQ( Host.Parameters().GetGroups().size(), 1u );
  Hardware.m_pRegistry->m_pManager.reset();
  EXPECT_TRUE( Host.Parameters().GetGroups().empty() );
}

}
