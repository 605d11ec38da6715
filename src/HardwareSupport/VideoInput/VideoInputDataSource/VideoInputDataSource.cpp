#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSource.h"

#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputBufferClient.h"
#include "NotificationSystem/AsioPostalService.h"
#include "NotificationSystem/WeakBinder.h"
#include "StageCorePluginInterface/StageCoreHost.h"

#include <boost/thread/lock_guard.hpp>

#include <utility>

namespace VideoInputHAL
{

using KVZ::IClock;
using KVZ::VTick;
using StageCorePluginInterface::ICaptureTargets;
using StageCorePluginInterface::IServiceObject;
using StageCorePluginInterface::ITimeService;
using StageCorePluginInterface::VCaptureTarget;

namespace
{

constexpr uint64_t MaxLiveFrames = 10;

// What an entry of the buffer holds of a frame.
struct VPayload
{
  VVideoInputDataSourceFrame* m_pFrame;
};

VVideoInputDataSourceFrame* PayloadOf( SyncSystem::VFrameEntry* i_pEntry )
{
  return static_cast<VPayload*>( SyncSystem::Payload( i_pEntry ) )->m_pFrame;
}

// The source's settings; also gives the options a service, so that both have the same.
SyncSystem::VDataSourceSettings MakeSettings( const IVideoInputDevice& i_rDevice, const std::shared_ptr<VVideoInputDataSourceAllocator>& i_pAllocator,
  VVideoInputDataSourceOptions& io_rOptions )
{
  SyncSystem::VDataSourceSettings Settings;
  Settings.m_Name = i_rDevice.GetDeviceURN();
  if( !io_rOptions.m_pPostalService )
  {
    io_rOptions.m_pPostalService = std::make_shared<NotificationSystem::VAsioPostalService>( Settings.m_Name );
  }
  Settings.m_pPostalService = io_rOptions.m_pPostalService;
  Settings.m_pAllocator = i_pAllocator->BufferAllocator();
  Settings.m_NoticeSeconds = io_rOptions.m_NoticeSeconds;
  Settings.m_pAnalysis = io_rOptions.m_pAnalysis;
  // Frames name their allocator, so it lives as long as the buffer does.
  Settings.m_DeleteFrame = [i_pAllocator]( SyncSystem::VFrameEntry* i_pEntry )
  {
    VVideoInputDataSourceFrame* pFrame = PayloadOf( i_pEntry );
    pFrame->m_pAllocator->Free( pFrame );
  };
  return Settings;
}

}

VVideoInputDataSource::VVideoInputDataSource( std::shared_ptr<VVideoInputDeviceManager> i_pManager, std::shared_ptr<IVideoInputDevice> i_pDevice,
  const std::shared_ptr<VVideoInputDataSourceAllocator>& i_pAllocator, const std::shared_ptr<IServiceObject>& i_pFirstService,
  const std::shared_ptr<IServiceObject>& i_pSecondService, std::shared_ptr<ICaptureTargets> i_pCaptureTargets, std::shared_ptr<ITimeService> i_pTime,
  VVideoInputDataSourceOptions i_Options )
  : VDataSource( MakeSettings( *i_pDevice, i_pAllocator, i_Options ) ),
    m_Options( std::move( i_Options ) ),
    m_pDeviceManager( std::move( i_pManager ) ),
    m_pDevice( std::move( i_pDevice ) ),
    m_pCaptureTargets( std::move( i_pCaptureTargets ) ),
    m_pTime( std::move( i_pTime ) ),
    m_LocalTimecodeSource( SourceId() )
{
  for( const std::shared_ptr<IServiceObject>& pService : { i_pFirstService, i_pSecondService } )
  {
    if( pService )
    {
      pService->Release();
    }
  }
}

VVideoInputDataSource::~VVideoInputDataSource() { StopClient(); }

void VVideoInputDataSource::PostConstruct()
{
  VDataSource::PostConstruct();
  // Either may come with the device's lock held.
  m_pDevice->GetDroppedFramesCallback().AddImmediate(
    NotificationSystem::BindWeak( KVZ::WeakFrom( this ), &VVideoInputDataSource::OnDroppedFrames ) );
  m_pDevice->GetStatusChangedCallback().AddImmediate(
    NotificationSystem::BindWeak( KVZ::WeakFrom( this ), []( VVideoInputDataSource& i_rThis ) { i_rThis.m_bCountIsLoss = false; } ) );
}

void VVideoInputDataSource::OnDroppedFrames( unsigned int i_Count )
{
  if( m_bCountIsLoss )
  {
    CountDroppedFrames( i_Count );
  }
}

bool VVideoInputDataSource::OnVideoInputData( uint32_t i_FrameIndex, VVideoInputDataSourceFrame* i_pFrame, const KVZ::ITimecode* i_pTimecode,
  const int64_t* i_pPeriod )
{
  SyncSystem::VIncomingFrame Frame;
  Frame.m_Now = m_pTime ? m_pTime->Now() : 0.0;
  m_bCountIsLoss = true;
  if( !i_pFrame || !i_pPeriod || *i_pPeriod <= 0 )
  {
    return false;
  }
  i_pFrame->m_FrameScale = m_FrameScale;
  i_pFrame->m_DeliveryTime = Frame.m_Now;
  i_pFrame->m_VideoInfo.m_PixelAspectRatio = m_PixelAspectRatio.load( std::memory_order_relaxed );
  Frame.m_Period = VTick( *i_pPeriod );
  Frame.m_BeatPeriod = Frame.m_Period;
  Frame.m_pMemory = i_pFrame;
  return ReadClocks( { i_FrameIndex, i_pTimecode }, Frame ) &&
    AddFrame( Frame, sizeof( VPayload ),
      [i_pFrame]( void* o_pPayload )
      {
        static_cast<VPayload*>( o_pPayload )->m_pFrame = i_pFrame;
        return true;
      } );
}

bool VVideoInputDataSource::ReadClocks( const VDelivered& i_rDelivered, SyncSystem::VIncomingFrame& io_rFrame )
{
  io_rFrame.m_Clocks.Set( IClock( IClock::FrameNumber, 0, SourceId() ), io_rFrame.m_Period * i_rDelivered.m_Index );
  const KVZ::ITimecode* pTimecode = i_rDelivered.m_pTimecode;
  if( pTimecode && KVZ::IsValid( *pTimecode ) )
  {
    const uint64_t Source = m_bUseGlobalTimecode ? 0 : m_LocalTimecodeSource;
    io_rFrame.m_Clocks.Set( IClock( IClock::Timecode, pTimecode->m_Standard + 1, Source ),
      VTick( KVZ::ToTicks( *pTimecode ) + m_TimecodeAdjustment.load( std::memory_order_relaxed ) ) );
  }
  return true;
}

void VVideoInputDataSource::SetUseTimecodeForSync( bool i_bUse )
{
  if( m_bUseGlobalTimecode.exchange( i_bUse ) != i_bUse )
  {
    BeginAnew();
  }
}

void VVideoInputDataSource::SetTimecodeAdjustment( VTick i_Adjustment )
{
  if( m_TimecodeAdjustment.exchange( i_Adjustment.Count() ) != i_Adjustment.Count() )
  {
    KVZ_LOG( Log(), 5, "Setting timecode adjustment to %d ticks.", i_Adjustment.Count() );
    BeginAnew();
  }
}

SyncSystem::EReadResult::Enum VVideoInputDataSource::GetFrames( uint64_t i_WakeToken, SyncSystem::VReadFrames& o_rRead )
{
  return ReadFramesOrSleep( MaxLiveFrames, i_WakeToken, o_rRead );
}

const VVideoInputDataSourceFrame* VVideoInputDataSource::FrameOf( const SyncSystem::VFrameEntry* i_pEntry )
{
  return static_cast<const VPayload*>( SyncSystem::Payload( i_pEntry ) )->m_pFrame;
}

bool VVideoInputDataSource::BeginCapture( const KVZ::ICaptureHeader& i_rHeader,
  const std::shared_ptr<const SyncSystem::VGlobalSyncSessionInfo>& i_pInfo, uint32_t, std::vector<SyncSystem::VCaptureError>& io_rErrors )
{
  StopClient();
  const std::string URN = GetSourceName();
  std::vector<VCaptureTarget> Targets;
  for( const int32_t Container : m_pCaptureTargets ? m_pCaptureTargets->GetContainers( URN ) : std::vector<int32_t>() )
  {
    if( !m_Options.m_pWriterFactory || !m_Options.m_pWriterFactory->IsRegistered( static_cast<KVZ::IVideoContainer::Enum>( Container ) ) )
    {
      const char* pText = "Unsupported video container format for capture.";
      KVZ_LOG_ERROR( "VideoInputDataSource", pText );
      io_rErrors.push_back( { SyncSystem::ECaptureFailure::ReportedErrors, pText } );
      return false;
    }
    VCaptureTarget Target;
    if( m_pCaptureTargets->GetTarget( i_rHeader, URN, Container, Target ) )
    {
      Targets.push_back( std::move( Target ) );
    }
    else
    {
      io_rErrors.push_back( { SyncSystem::ECaptureFailure::ReportedErrors,
        "Failed to get capture target for video capture device '" + m_pDevice->GetDeviceName() + "'." } );
    }
  }
  if( !Targets.empty() )
  {
    StartClient( i_rHeader, i_pInfo, Targets );
  }
  return true;
}

void VVideoInputDataSource::StartClient( const KVZ::ICaptureHeader& i_rHeader,
  const std::shared_ptr<const SyncSystem::VGlobalSyncSessionInfo>& i_pInfo, const std::vector<VCaptureTarget>& i_rTargets )
{
  VVideoInputBufferClient::VSettings Settings;
  Settings.m_pBuffer = Buffer();
  Settings.m_Header = i_rHeader;
  Settings.m_pSession = i_pInfo;
  Settings.m_pCaptureTargets = m_pCaptureTargets;
  Settings.m_pWriterFactory = m_Options.m_pWriterFactory;
  Settings.m_Encoder = m_Options.m_Encoder;
  Settings.m_pPostalService = m_Options.m_MakeWriterService ? m_Options.m_MakeWriterService() : nullptr;
  Settings.m_pFrameService = m_Options.m_MakeFrameService ? m_Options.m_MakeFrameService() : nullptr;
  const auto pClient = std::make_shared<VVideoInputBufferClient>( std::move( Settings ) );
  pClient->AddDevice( { GetSourceName(), m_pDevice->GetManufacturerName(), m_pDevice->GetDriverName(), m_pDevice->GetDeviceName() } );
  for( const VCaptureTarget& rTarget : i_rTargets )
  {
    pClient->AddFile( rTarget );
  }
  pClient->Start();
  boost::lock_guard<boost::mutex> Lock( m_ClientMutex );
  m_pBufferClient = pClient;
}

void VVideoInputDataSource::StopClient()
{
  std::shared_ptr<VVideoInputBufferClient> pClient;
  {
    boost::lock_guard<boost::mutex> Lock( m_ClientMutex );
    pClient.swap( m_pBufferClient );
  }
  if( pClient )
  {
    pClient->Stop();
  }
}

bool VVideoInputDataSource::IsCaptureDraining()
{
  std::shared_ptr<VVideoInputBufferClient> pClient;
  {
    boost::lock_guard<boost::mutex> Lock( m_ClientMutex );
    pClient = m_pBufferClient;
  }
  return pClient && pClient->HasOpenFiles();
}

}
