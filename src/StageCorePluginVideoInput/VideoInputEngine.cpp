#include "StageCorePluginVideoInput/VideoInputEngine.h"

#include "Flow2/Flow2Utils/FlowNodeFactory.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/DeviceUrnMap.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/FlowNodeVideoInputDataSource.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSource.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSourceTriggered.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDeviceManager.h"
#include "NotificationSystem/AsioPostalService.h"
#include "NotificationSystem/WeakBinder.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCorePluginVideoInput/Composition.h"
#include "StageCorePluginVideoInput/VideoInputDeviceParameterHandler.h"
#include "StageCorePluginVideoInput/VideoInputSystemParameterHandler.h"
#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/Shared.h"
#include "StageCoreRuntime/ShutdownObject.h"
#include "SyncSystem/CaptureBufferAllocator.h"
#include "Utils/UtilsMemory/BalancingAllocator.h"

using namespace StageCorePluginInterface;
using VideoInputHAL::IVideoInputDevice;
using VideoInputHAL::VDeviceUrnMap;
using VideoInputHAL::VFlowNodeVideoInputDataSource;
using VideoInputHAL::VVideoInputDataSource;
using VideoInputHAL::VVideoInputDataSourceAllocator;
using VideoInputHAL::VVideoInputDataSourceMap;
using VideoInputHAL::VVideoInputDeviceManager;

namespace
{

// Bytes of frames that each device's buffer may claim for itself.
constexpr size_t DeviceShareBytes = 0x10000000;
constexpr size_t FrameAlignment = 16;
constexpr int VideoFileKind = 2;

std::shared_ptr<VVideoInputDataSourceAllocator> MakeFrameAllocator( UtilsMemory::VBalancingAllocator& io_rBalancing )
{
  const auto pClient = io_rBalancing.MakeClient();
  pClient->SetShare( DeviceShareBytes / io_rBalancing.GetBlockSize() );
  return std::make_shared<VVideoInputDataSourceAllocator>( std::make_shared<SyncSystem::VCaptureBufferAllocator>( pClient, FrameAlignment ) );
}

template<class T>
void HandOver( IShutdownManager& i_rManager, const std::shared_ptr<T>& i_pObject, const char* i_pFile, int i_Line )
{
  i_rManager.AddShutdownObject( std::make_unique<KVZ::Detail::VShutdownObject<T>>( i_pObject, i_pFile, i_Line ) );
}

}

// The maps change on the engine's thread, and in the destructor once the device manager has been shut down. Flow nodes look sources up on their own.
class VVideoInputEngine::VImpl : public KVZ::VShared
{
public:
  explicit VImpl( IStageCoreHost& i_rHost );
  ~VImpl() override;

  void Start();
  // Lets the engine's thread finish what has been posted, and ends it. What is posted later never runs.
  void StopThread() { m_pPostalService->Stop(); }
  bool StartCapture( const std::string& i_rDeviceURN ) const;
  bool StopCapture( const std::string& i_rDeviceURN ) const;
  std::shared_ptr<KVZ::IFlowNodeFactory> GetFlowNodeFactory() const;

private:
  void StartDrivers() { m_pDeviceManager->StartDiscovery(); }
  void OnDeviceAdded( std::shared_ptr<IVideoInputDevice> i_pDevice );
  std::shared_ptr<VVideoInputDataSource> MakeDataSource( const std::shared_ptr<IVideoInputDevice>& i_pDevice,
    const std::shared_ptr<VVideoInputDataSourceAllocator>& i_pAllocator );

  IStageCoreHost* const m_pHost;
  const std::shared_ptr<NotificationSystem::VAsioPostalService> m_pPostalService;
  std::shared_ptr<VVideoInputDeviceManager> m_pDeviceManager;
  VDeviceUrnMap<std::shared_ptr<VVideoInputDeviceParameterHandler>> m_ParameterHandlers;
  std::shared_ptr<VVideoInputDataSourceMap> m_pVideoInputDataSources;   // shared with flow node factories
  std::shared_ptr<VVideoInputSystemParameterHandler> m_pSystemParameterHandler;
};

VVideoInputEngine::VImpl::VImpl( IStageCoreHost& i_rHost )
  : m_pHost( &i_rHost ),
    m_pPostalService( std::make_shared<NotificationSystem::VAsioPostalService>( "Video Input Engine" ) ),
    m_pDeviceManager( KVZ::MakeShared<VVideoInputDeviceManager>( Composition::DriverMakers() ) )
{
  VideoEncoding::DefaultEncoderParts() = Composition::EncoderParts();
  const std::shared_ptr<IShutdownManager> pShutdown = m_pHost->GetShutdownManager();
  HandOver( *pShutdown, m_pDeviceManager, __FILE__, __LINE__ );
  m_pHost->SetFileFilters( VideoFileKind, { "*.avi", "*.mov", "*.mp4", "*.tvid", "*.mkv" } );
  m_pSystemParameterHandler = KVZ::MakeShared<VVideoInputSystemParameterHandler>( m_pPostalService, m_pHost->GetDataStore(),
    m_pHost->GetParameterRegistry() );
  HandOver( *pShutdown, m_pSystemParameterHandler, __FILE__, __LINE__ );
  m_pVideoInputDataSources = std::make_shared<VVideoInputDataSourceMap>();
  m_pHost->GetFlowNodeRegistry()->AddFactory( GetFlowNodeFactory() );
}

VVideoInputEngine::VImpl::~VImpl()
{
  std::vector<std::shared_ptr<IVideoInputDevice>> Devices;
  m_pDeviceManager->GetDevices( Devices );
  m_pDeviceManager->Shutdown();
  // A driver that is announcing a card at this moment ends later than the manager, and its cards go on streaming: without a receiver no frame
  // arrives.
  for( const std::shared_ptr<IVideoInputDevice>& pDevice : Devices )
  {
    pDevice->SetDataCallback( {} );
  }
  m_ParameterHandlers.Clear();
  const std::shared_ptr<ISourceRegistry> pSources = m_pHost->GetSourceRegistry();
  const auto All = m_pVideoInputDataSources->GetAll();
  for( const auto& pSource : All )
  {
    pSources->RemoveSource( pSource );
  }
  m_pVideoInputDataSources->Clear();
  m_pSystemParameterHandler.reset();
}

void VVideoInputEngine::VImpl::Start()
{
  m_pDeviceManager->GetDeviceAddedCallback().Add( NotificationSystem::BindWeak( KVZ::WeakFrom( this ), &VImpl::OnDeviceAdded ), m_pPostalService );
  m_pHost->GetHardwareStartEvent()->Add( NotificationSystem::BindWeak( KVZ::WeakFrom( this ), &VImpl::StartDrivers ), {} );
}

// Engine's thread. The device gets its receiver and allocator last, when all that a first frame can touch is in place.
void VVideoInputEngine::VImpl::OnDeviceAdded( std::shared_ptr<IVideoInputDevice> i_pDevice )
{
  const std::string URN = i_pDevice->GetDeviceURN();
  const std::shared_ptr<UtilsMemory::VBalancingAllocator> pBalancing = m_pHost->GetBalancingAllocator();
  const auto pHeldBack = pBalancing->MakeClient();   // takes part in the balance until the device is wired
  const std::shared_ptr<VVideoInputDataSourceAllocator> pAllocator = MakeFrameAllocator( *pBalancing );
  const std::shared_ptr<VVideoInputDataSource> pSource = MakeDataSource( i_pDevice, pAllocator );
  const std::shared_ptr<ISourceRegistry> pSources = m_pHost->GetSourceRegistry();

  m_ParameterHandlers.Insert( URN,
    KVZ::MakeShared<VVideoInputDeviceParameterHandler>( m_pPostalService, m_pHost->GetDataStore(), m_pHost->GetParameterRegistry(),
      m_pHost->GetCaptureTargets(), pSources, i_pDevice, pSource, Composition::WritableContainers() ) );
  pSources->AddSource( pSource );
  m_pVideoInputDataSources->Insert( URN, pSource );
  i_pDevice->SetDataCallback( pSource );
  i_pDevice->SetAllocator( pAllocator );
}

std::shared_ptr<VVideoInputDataSource> VVideoInputEngine::VImpl::MakeDataSource( const std::shared_ptr<IVideoInputDevice>& i_pDevice,
  const std::shared_ptr<VVideoInputDataSourceAllocator>& i_pAllocator )
{
  VideoInputHAL::VVideoInputDataSourceOptions Options;
  Options.m_pWriterFactory = Composition::WriterFactory();
  if( i_pDevice->IsTriggered() )
  {
    return KVZ::MakeShared<VideoInputHAL::VVideoInputDataSourceTriggered>( m_pDeviceManager, i_pDevice, i_pAllocator, m_pHost->GetTriggerService(),
      m_pHost->GetFirstSourceService(), m_pHost->GetSecondSourceService(), m_pHost->GetCaptureTargetService(), m_pHost->GetTimeService(), Options );
  }
  return KVZ::MakeShared<VVideoInputDataSource>( m_pDeviceManager, i_pDevice, i_pAllocator, m_pHost->GetFirstSourceService(),
    m_pHost->GetSecondSourceService(), m_pHost->GetCaptureTargetService(), m_pHost->GetTimeService(), Options );
}

std::shared_ptr<KVZ::IFlowNodeFactory> VVideoInputEngine::VImpl::GetFlowNodeFactory() const
{
  KVZ_ASSERT( m_pVideoInputDataSources != nullptr );
  return std::make_shared<Flow2Utils::VFlowNodeFactory1<VFlowNodeVideoInputDataSource, std::shared_ptr<VVideoInputDataSourceMap>>>(
    m_pVideoInputDataSources );
}

bool VVideoInputEngine::VImpl::StartCapture( const std::string& i_rDeviceURN ) const
{
  const auto* pHandler = m_ParameterHandlers.Find( i_rDeviceURN );
  return pHandler && ( *pHandler )->StartCapture();
}

bool VVideoInputEngine::VImpl::StopCapture( const std::string& i_rDeviceURN ) const
{
  const auto* pHandler = m_ParameterHandlers.Find( i_rDeviceURN );
  return pHandler && ( *pHandler )->StopCapture();
}

VVideoInputEngine::VVideoInputEngine( IStageCoreHost& i_rHost ) : m_pImpl( KVZ::MakeShared<VImpl>( i_rHost ) )
{
  HandOver( *i_rHost.GetShutdownManager(), m_pImpl, __FILE__, __LINE__ );
}

// An arrival that runs now owns the implementation too. It must not end with that call, on the engine's thread, when the host has gone.
VVideoInputEngine::~VVideoInputEngine() { m_pImpl->StopThread(); }

void VVideoInputEngine::Start() { m_pImpl->Start(); }

std::shared_ptr<KVZ::IFlowNodeFactory> VVideoInputEngine::GetFlowNodeFactory() const { return m_pImpl->GetFlowNodeFactory(); }

bool VVideoInputEngine::StartCapture( const std::string& i_rDeviceURN ) { return m_pImpl->StartCapture( i_rDeviceURN ); }

bool VVideoInputEngine::StopCapture( const std::string& i_rDeviceURN ) { return m_pImpl->StopCapture( i_rDeviceURN ); }
