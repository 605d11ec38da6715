#include "host/StandAloneHost.h"

#include "NotificationSystem/AsioPostalService.h"
#include "NotificationSystem/WeakBinder.h"
#include "StageCoreDataStore/DataWriter.h"
#include "Utils/UtilsMemory/BalancingAllocator.h"
#include "host/DataStore.h"

#include <algorithm>
#include <future>

namespace StageHost
{

namespace
{

// Every device is promised enough to take the next frame while an old block is drained.
constexpr size_t GuaranteedBlocks = 2;

std::shared_ptr<UtilsMemory::VBalancingAllocator> MakeAllocator( size_t i_MemoryMiB )
{
  auto pAllocator = std::make_shared<UtilsMemory::VBalancingAllocator>( FrameBlockSize );
  pAllocator->Configure( std::max<size_t>( 1, ( i_MemoryMiB << 20 ) / FrameBlockSize ), 0, GuaranteedBlocks );
  return pAllocator;
}

// Everything that was posted before has run.
void WaitFor( KVZ::IPostalService& i_rService )
{
  const auto pReached = std::make_shared<std::promise<void>>();
  i_rService.Post( [pReached] { pReached->set_value(); } );
  pReached->get_future().wait();
}

// On the sync engine's thread.
void PublishMasterRate( VSyncEngine& i_rEngine, IDataStore& io_rDataStore )
{
  const double Rate = 1.0 / i_rEngine.GetMasterClock()->GetPeriod().Seconds();
  VDataWriter( io_rDataStore ).SetValue( VDataPath{ "Gn6System", "FrameRateActual" }, KVZ::Variant::Make( Rate ) );
}

}

VStandAloneHost::VStandAloneHost( const VHostOptions& i_rOptions )
  : m_pDataStore( std::make_shared<VDataStore>() ),
    m_SettingsFile( i_rOptions.m_SettingsPath ),
    m_pTime( std::make_shared<VMonotonicTime>() ),
    m_pAllocator( MakeAllocator( i_rOptions.m_MemoryMiB ) ),
    m_pShutdown( std::make_shared<VShutdownManager>() ),
    m_pFlowNodes( std::make_shared<VFlowNodeRegistry>() ),
    m_pRestoredSettings( std::make_shared<VRestoredSettings>( m_pDataStore ) ),
    m_pParameters( std::make_shared<VParameterRegistry>(
      [pRestored = m_pRestoredSettings]( const IParameterGroup& i_rGroup ) { pRestored->Check( i_rGroup ); } ) ),
    m_pHardwareStart( std::make_shared<VHardwareStartEvent>() ),
    m_pHardware( std::make_shared<VHardwareRegistry>() ),
    m_pTargets( std::make_shared<VCaptureTargets>( m_pDataStore ) ),
    m_pTriggerService( std::make_shared<VNamedService>( "Trigger" ) ),
    m_pFirstService( std::make_shared<VNamedService>( "FlowServices" ) ),
    m_pSecondService( std::make_shared<VNamedService>( "SourceServices" ) ),
    m_pEngineService( std::make_shared<NotificationSystem::VAsioPostalService>( "Sync Engine" ) ),
    m_pEngine( std::make_shared<VSyncEngine>( m_pEngineService, std::make_shared<VAsioDelayedCalls>( m_pEngineService ) ) )
{
  m_pEngine->GetMasterPeriodChangedCallback().AddImmediate( NotificationSystem::BindWeak( m_pEngine,
    [pDataStore = m_pDataStore]( VSyncEngine& i_rEngine ) { PublishMasterRate( i_rEngine, *pDataStore ); } ) );
}

VStandAloneHost::~VStandAloneHost() { StopModule(); }

std::vector<std::string> VStandAloneHost::RestoreSettings()
{
  std::vector<std::string> Messages = m_SettingsFile.Restore( *m_pDataStore );
  m_pRestoredSettings->TakeAll();
  return Messages;
}

bool VStandAloneHost::StartModule( const std::string& i_rPath, std::string& o_rError )
{
  m_pModule = VLoadedModule::Load( i_rPath, o_rError );
  if( !m_pModule )
  {
    return false;
  }
  VHardwareHost Hardware( m_pHardware );
  StageCorePluginInterface::IPlugin& rPlugin = m_pModule->Plugin();
  const bool bStarted = rPlugin.Initialise( *this ) && rPlugin.RegisterFlowNodeFactories( *m_pFlowNodes ) &&
    rPlugin.RegisterHardware( nullptr, Hardware );
  if( !bStarted )
  {
    o_rError = "The module \"" + i_rPath + "\" refuses to start.";
    StopModule();
    return false;
  }
  m_pHardwareStart->Fire();
  return true;
}

// Nodes use the module's sources until they have ended. Then the shutdown objects go: what nobody owns any more ends there. Then every owner of the
// module's engine lets go.
void VStandAloneHost::StopModule()
{
  m_Flow.Clear();
  m_pShutdown->Shutdown();
  m_pHardware->ReleaseManagers();
  m_pFlowNodes->Clear();
  m_pModule.reset();
  m_pParameters->Clear();
  WaitFor( *m_pEngineService );   // the sync engine may be in the middle of a session with sources that have just been removed
}

}
