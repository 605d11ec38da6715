#include "bench/FrameFeed.h"

#include "FileIO/TarvoVideo/Writer.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDeviceManager.h"
#include "NotificationSystem/AsioPostalService.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCoreRuntime/Shared.h"
#include "Utils/UtilsMemory/BalancingAllocator.h"
#include "bench/Measuring.h"
#include "tests/support/FakeVideoInputDevice.h"

#include <stdexcept>

using VideoInputHAL::VVideoInputDataSource;
using VideoInputHAL::VVideoInputDataSourceAllocator;
using VideoInputHAL::VVideoInputDataSourceFrame;

// Frames come back to back here. Each is timed where it would have come from a card, later by the clock's own last digits: up to 0.1 ms.
class VFrameFeed::VTime : public StageCorePluginInterface::ITimeService
{
public:
  double Now() override { return m_Due + static_cast<double>( NowNanoseconds() % 1000 ) * 1e-7; }

  double m_Due = 1.0;
};

namespace
{

class VSteadyClock : public KVZ::IBaseLineClock
{
public:
  std::string GetName() const override { return "Benchmark"; }
  KVZ::VTick GetPeriod() const override { return VFrameFeed::Period; }
};

// Finds the one device.
class VFeedDriver : public VideoInputHAL::IVideoInputDriver
{
public:
  VDeviceCallback& GetDeviceArrivedCallback() override { return m_Arrived; }
  void StartDiscovery() override { m_Arrived( std::make_shared<TestSupport::VFakeVideoInputDevice>() ); }

private:
  NotificationSystem::VMultiCallbackPostal<void( std::shared_ptr<VideoInputHAL::IVideoInputDevice> )> m_Arrived;
};

std::shared_ptr<VideoInputHAL::VVideoInputDeviceManager> MakeManager()
{
  std::vector<VideoInputHAL::VDriverMaker> Makers = { [] { return std::make_shared<VFeedDriver>(); } };
  auto pManager = KVZ::MakeShared<VideoInputHAL::VVideoInputDeviceManager>( std::move( Makers ) );
  pManager->StartDiscovery();
  return pManager;
}

size_t Round16( size_t i_Bytes ) { return ( i_Bytes + 15 ) / 16 * 16; }

// Room for so many frames and their entries, and not one more.
size_t BlockBytes( const VFeedSettings& i_rSettings )
{
  constexpr size_t BlockHeader = 64;
  constexpr size_t AllocationHeader = 16;
  const size_t Entry = sizeof( SyncSystem::VFrameEntry ) + Round16( sizeof( void* ) );
  return BlockHeader + i_rSettings.m_FramesPerBlock * ( 2 * AllocationHeader + Round16( i_rSettings.m_FrameBytes ) + Entry );
}

std::shared_ptr<VVideoInputDataSourceAllocator> MakeAllocator( const VFeedSettings& i_rSettings )
{
  const auto pPool = std::make_shared<UtilsMemory::VBalancingAllocator>( BlockBytes( i_rSettings ) );
  if( !pPool->Configure( ( i_rSettings.m_Frames + i_rSettings.m_FramesPerBlock - 1 ) / i_rSettings.m_FramesPerBlock + 1, 0, 0 ) )
  {
    throw std::runtime_error( "There is not enough memory for the frames." );
  }
  return std::make_shared<VVideoInputDataSourceAllocator>( std::make_shared<SyncSystem::VCaptureBufferAllocator>( pPool->MakeClient() ) );
}

std::shared_ptr<const KVZ::VVideoWriterFactory> MakeWriters()
{
  const auto pFactory = std::make_shared<KVZ::VVideoWriterFactory>();
  pFactory->Register( KVZ::IVideoContainer::ETVID,
    []( KVZ::IVideoContainer::Enum, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder )
    { return std::make_shared<TarvoVideo::VWriter>( std::move( i_pEncoder ) ); } );
  return pFactory;
}

}

VFrameFeed::VFrameFeed( const VFeedSettings& i_rSettings )
  : m_Settings( i_rSettings ),
    m_pTime( std::make_shared<VTime>() ),
    m_pPostalService( std::make_shared<NotificationSystem::VAsioPostalService>( "Benchmark" ) ),
    m_pAllocator( MakeAllocator( i_rSettings ) ),
    m_pSource( KVZ::MakeShared<VVideoInputDataSource>( MakeManager(), std::make_shared<TestSupport::VFakeVideoInputDevice>(), m_pAllocator, nullptr,
      nullptr, i_rSettings.m_pCaptureTargets, m_pTime,
      VideoInputHAL::VVideoInputDataSourceOptions{ .m_pWriterFactory = MakeWriters(), .m_pPostalService = m_pPostalService } ) )
{
  m_Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode25;
}

VFrameFeed::~VFrameFeed() = default;

VVideoInputDataSourceFrame* VFrameFeed::MakeFrame()
{
  void* pMemory = m_pAllocator->Allocate( m_Settings.m_FrameBytes );
  if( !pMemory )
  {
    throw std::runtime_error( "There is no memory for a frame." );
  }
  auto* pFrame = new( pMemory ) VVideoInputDataSourceFrame;
  pFrame->m_pAllocator = m_pAllocator.get();
  pFrame->m_Timecode = m_Timecode;
  return pFrame;
}

int64_t VFrameFeed::Deliver( VVideoInputDataSourceFrame* i_pFrame )
{
  const int64_t Ticks = Period.Count();
  const int64_t Begin = NowNanoseconds();
  const bool bTaken = m_pSource->OnVideoInputData( m_FrameIndex, i_pFrame, &m_Timecode, &Ticks );
  const int64_t End = NowNanoseconds();
  if( !bTaken )
  {
    throw std::runtime_error( "The data source refused a frame." );
  }
  ++m_FrameIndex;
  KVZ::AddTicks( m_Timecode, Ticks );
  m_pTime->m_Due += Period.Seconds();
  return End - Begin;
}

void VFrameFeed::JoinSession()
{
  KVZ::ISourceTemporal& rTemporal = m_pSource->Temporal();
  const auto Session = rTemporal.DeclareGlobalSyncSession( KVZ::VGlobalSyncSessionId( 1 ), std::make_shared<VSteadyClock>() );
  if( !Session )
  {
    throw std::runtime_error( "The data source does not take part in the session." );
  }
  KVZ::ITickInClocks Ticks = Session->m_StartTime;
  Ticks.Set( KVZ::IClock(), KVZ::VTick( 0 ) );
  rTemporal.ArmGlobalSyncSession();
  rTemporal.StartGlobalSyncSession( Ticks, KVZ::VTick( 0 ) );
}

int64_t VFrameFeed::HeldFrames() const
{
  const auto& rBuffer = *m_pSource->Buffer();
  SyncSystem::VToken First;
  SyncSystem::VToken Last;
  int64_t Frames = -1;
  if( rBuffer.GetFirstToken( rBuffer.GetCurrentBufferSession(), First ) && rBuffer.GetNewestToken( Last ) )
  {
    SyncSystem::VCaptureBuffer::Distance( First, Last, Frames );
  }
  return Frames + 1;
}
