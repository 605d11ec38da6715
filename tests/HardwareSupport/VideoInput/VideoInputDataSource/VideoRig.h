// A video data source with all that is around it: a device, memory, capture targets, writers, and services that run when the test says so.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSource.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDeviceManager.h"
#include "StageCorePluginInterface/StageCoreHost.h"

#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/FakeWriter.h"
#include "tests/support/FakeVideoInputDevice.h"
#include "tests/support/FrameMemory.h"
#include "tests/support/HandTime.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

using KVZ::IClock;
using KVZ::VTick;
using VideoInputHAL::VVideoInputDataSource;
using VideoInputHAL::VVideoInputDataSourceFrame;

constexpr VTick Period( 5400000 );   // 25 frames a second
const VTick CounterStart( 987654321 );

// The global tick of frame i_Index of the first session.
inline VTick At( int64_t i_Index ) { return CounterStart + Period * i_Index; }

class VCountedService : public StageCorePluginInterface::IServiceObject
{
public:
  std::string GetServiceName() const override { return "Service"; }
  void Release() override { ++m_Releases; }
  int m_Releases = 0;
};

// Any thread.
class VFakeCaptureTargets : public StageCorePluginInterface::ICaptureTargets
{
public:
  std::vector<int32_t> GetContainers( const std::string& ) override { return m_Containers; }
  bool GetTarget( const KVZ::ICaptureHeader& i_rHeader, const std::string&, int32_t i_Container,
    StageCorePluginInterface::VCaptureTarget& o_rTarget ) override
  {
    o_rTarget = m_Target;
    o_rTarget.m_BaseName = i_rHeader.m_Name;
    o_rTarget.m_Extension = KVZ::GetFileExtension( static_cast<KVZ::IVideoContainer::Enum>( i_Container ) );
    o_rTarget.m_Container = i_Container;
    return i_Container != m_RefusedContainer;
  }
  void OnFileFinished( const StageCorePluginInterface::VCaptureFileReport& i_rReport ) override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Reports.push_back( i_rReport );
  }
  void GetFolderAliases( std::vector<std::string>& ) override {}
  KVZ::IMultiCallbackPostal<void()>& GetFolderAliasesChangedCallback() override { return m_Changed; }

  std::vector<StageCorePluginInterface::VCaptureFileReport> Reports() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Reports;
  }

  std::vector<int32_t> m_Containers{ KVZ::IVideoContainer::ETVID };
  int32_t m_RefusedContainer = -1;
  StageCorePluginInterface::VCaptureTarget m_Target{ {}, {}, {}, "Label", 0, KVZ::IVideoPayload::EUncompressed, KVZ::IAudioPayload::EUncompressed };

private:
  mutable boost::mutex m_Mutex;
  std::vector<StageCorePluginInterface::VCaptureFileReport> m_Reports GUARDED_BY( m_Mutex );
  NotificationSystem::VMultiCallbackPostal<void()> m_Changed;
};

class VTestVideoSource : public VVideoInputDataSource
{
public:
  using VDataSource::PostToStrand;
  using VDataSource::SourceId;
  using VVideoInputDataSource::VVideoInputDataSource;
};

// What a device says of its frames.
struct VFrameFormat
{
  uint32_t m_Width = 8;
  uint32_t m_Height = 4;
  KVZ::IPixelFormat::Enum m_PixelFormat = KVZ::IPixelFormat::EU8Y8V8Y8;
  KVZ::AudioFrameInfo m_Audio{ KVZ::IAudioSampleFormat::EInt16, 48000, 4 };
  uint32_t m_Samples = 20;
};

class VVideoRig
{
public:
  explicit VVideoRig( size_t i_Frames = 80 ) : m_Memory( i_Frames / 4, 4, 9000 ) { m_pTargets->m_Target.m_Folder = m_Folder.File( "takes" ); }

  // Any source class with the constructor of a data source, for the rig's device or another one, which a manager knows.
  template<class TSource = VTestVideoSource>
  std::shared_ptr<TSource> Make( VideoInputHAL::VVideoInputDataSourceOptions i_Options = {},
    std::shared_ptr<VideoInputHAL::IVideoInputDevice> i_pDevice = nullptr )
  {
    const auto pDevice = i_pDevice ? i_pDevice : m_pDevice;
    const auto pDriver = std::make_shared<TestSupport::VFakeVideoInputDriver>();
    pDriver->m_OnDiscovery = { pDevice };
    m_pManager = KVZ::MakeShared<VideoInputHAL::VVideoInputDeviceManager>(
      std::vector<VideoInputHAL::VDriverMaker>{ [pDriver] { return pDriver; } } );
    m_pManager->StartDiscovery();
    m_pFrames = std::make_shared<VideoInputHAL::VVideoInputDataSourceAllocator>( m_Memory.m_pAllocator );
    auto pFactory = std::make_shared<KVZ::VVideoWriterFactory>();
    for( const auto Container : { KVZ::IVideoContainer::ETVID, KVZ::IVideoContainer::EMOV, KVZ::IVideoContainer::EIMAGES } )
    {
      pFactory->Register( Container, [pDisk = m_pDisk, Container]( auto, auto ) { return std::make_shared<VFakeWriter>( pDisk, Container ); } );
    }
    i_Options.m_pWriterFactory = pFactory;
    if( !m_bThreads )
    {
      i_Options.m_pPostalService = m_pStrand;
      i_Options.m_MakeWriterService = [pService = m_pWriterService] { return pService; };
    }
    const auto pSource = KVZ::MakeShared<TSource>( m_pManager, pDevice, m_pFrames, m_pService, m_pService, m_pTargets, m_pTime, i_Options );
    m_pSource = pSource;
    return pSource;
  }

  // A frame as a device fills it, every byte told by its number.
  VVideoInputDataSourceFrame* MakeFrame( uint32_t i_Index )
  {
    const uint64_t ImageBytes = KVZ::GetImageSize( m_Format.m_PixelFormat, m_Format.m_Width, m_Format.m_Height );
    const uint64_t AudioBytes = uint64_t( m_Format.m_Samples ) * m_Format.m_Audio.m_Channels *
      KVZ::GetBytesPerSample( m_Format.m_Audio.m_SampleFormat );
    void* pBlock = m_pFrames->Allocate( VVideoInputDataSourceFrame::BlockSize( ImageBytes, AudioBytes ) );
    if( !pBlock )
    {
      return nullptr;
    }
    auto* pFrame = new( pBlock ) VVideoInputDataSourceFrame;
    pFrame->m_pAllocator = m_pFrames.get();
    pFrame->m_VideoInfo.m_ImageWidth = m_Format.m_Width;
    pFrame->m_VideoInfo.m_ImageHeight = m_Format.m_Height;
    pFrame->m_VideoInfo.m_PixelFormat = m_Format.m_PixelFormat;
    pFrame->m_AudioInfo = m_Format.m_Audio;
    pFrame->m_Timecode = m_Timecode;
    pFrame->m_ImageBytes = static_cast<uint32_t>( ImageBytes );
    pFrame->m_AudioBytes = static_cast<uint32_t>( AudioBytes );
    std::fill_n( pFrame->Image(), ImageBytes, static_cast<uint8_t>( i_Index ) );
    for( uint64_t Byte = 0; Byte < AudioBytes; ++Byte )
    {
      pFrame->Audio()[Byte] = static_cast<uint8_t>( i_Index + Byte );
    }
    return pFrame;
  }

  // Delivers the next frame; the memory of a refused one goes back.
  bool Deliver()
  {
    VVideoInputDataSourceFrame* pFrame = MakeFrame( m_NextIndex );
    if( !pFrame )
    {
      return false;
    }
    const int64_t Ticks = Period.Count();
    const bool bTaken = m_pSource->OnVideoInputData( m_NextIndex++, pFrame, &pFrame->m_Timecode, &Ticks );
    if( !bTaken )
    {
      m_pFrames->Free( pFrame );
    }
    KVZ::AddTicks( m_Timecode, Ticks );
    return bTaken;
  }
  void DeliverMany( int i_Count )
  {
    for( int Count = 0; Count < i_Count; ++Count )
    {
      ASSERT_TRUE( Deliver() );
    }
  }

  template<class TSource, class TFunction>
  void OnStrand( TSource& i_rSource, TFunction i_Function )
  {
    i_rSource.PostToStrand( i_Function );
    m_pStrand->RunAll();
  }

  KVZ::ISourceSyncSession Declare( VTestVideoSource& i_rSource, uint32_t i_Id )
  {
    KVZ::ISourceSyncSession Session;
    OnStrand( i_rSource,
      [&]
      {
        const auto Offered = i_rSource.DeclareGlobalSyncSession( KVZ::VGlobalSyncSessionId( i_Id ), nullptr );
        Session = Offered ? *Offered : Session;
      } );
    return Session;
  }

  // The session's counter reads 0 at CounterStart.
  void Join( VTestVideoSource& i_rSource, uint32_t i_Id )
  {
    KVZ::ITickInClocks Ticks = Declare( i_rSource, i_Id ).m_StartTime;
    ASSERT_FALSE( Ticks.IsEmpty() );
    Ticks.Set( IClock( IClock::GlobalTime, 0, 0 ), CounterStart );
    i_rSource.StartGlobalSyncSession( Ticks, VTick() );
    m_pStrand->RunAll();
  }

  // A streamed capture of session 1.
  void Start( VTestVideoSource& i_rSource, uint32_t i_Id, int64_t i_First, int64_t i_End, const std::string& i_rName = "Take" )
  {
    const KVZ::ICaptureHeader Header{ KVZ::VCaptureSessionId( i_Id ), i_rName, 0, KVZ::VGlobalSyncSessionId( 1 ) };
    OnStrand( i_rSource, [&] { EXPECT_TRUE( i_rSource.StartCapture( Header, At( i_First ), At( i_End ), false, 0 ) ); } );
  }
  void Cancel( VTestVideoSource& i_rSource )
  {
    OnStrand( i_rSource, [&] { i_rSource.CancelCapture(); } );
  }

  std::string Path( const std::string& i_rName = "Take", const std::string& i_rExtension = "tvid" ) const
  {
    return m_Folder.File( "takes/" + i_rName + "_Label." + i_rExtension );
  }

  const TestSupport::VTemporaryFolder m_Folder;
  TestSupport::VFrameMemory m_Memory;
  const std::shared_ptr<TestSupport::VFakeVideoInputDevice> m_pDevice = std::make_shared<TestSupport::VFakeVideoInputDevice>();
  const std::shared_ptr<TestSupport::VManualPostalService> m_pStrand = std::make_shared<TestSupport::VManualPostalService>();
  const std::shared_ptr<TestSupport::VManualPostalService> m_pWriterService = std::make_shared<TestSupport::VManualPostalService>();
  const std::shared_ptr<VFakeCaptureTargets> m_pTargets = std::make_shared<VFakeCaptureTargets>();
  const std::shared_ptr<TestSupport::VHandTime> m_pTime = std::make_shared<TestSupport::VHandTime>();
  const std::shared_ptr<VCountedService> m_pService = std::make_shared<VCountedService>();
  const std::shared_ptr<VFakeDisk> m_pDisk = std::make_shared<VFakeDisk>();
  std::shared_ptr<VideoInputHAL::VVideoInputDataSourceAllocator> m_pFrames;
  std::shared_ptr<VideoInputHAL::VVideoInputDeviceManager> m_pManager;
  std::shared_ptr<VVideoInputDataSource> m_pSource;
  bool m_bThreads = false;   // the source makes services of its own
  VFrameFormat m_Format;
  KVZ::ITimecode m_Timecode;   // of the next frame
  uint32_t m_NextIndex = 0;
};
