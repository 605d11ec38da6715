#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputBufferClient.h"

#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/FrameWorkers.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/SimpleBufferWrapper.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputFileRecord.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/WorkerThreads.h"
#include "NotificationSystem/AsioPostalService.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/thread.hpp>

#include <algorithm>
#include <exception>
#include <limits>
#include <utility>

namespace VideoInputHAL
{

using SyncSystem::EClientResult;
using SyncSystem::VRefCountedToken;

namespace
{

std::shared_ptr<VideoEncoding::VVideoFrameEncoder> MakeEncoder( const VVideoEncoderSettings& i_rSettings,
  const StageCorePluginInterface::VCaptureTarget& i_rTarget )
{
  auto pEncoder = std::make_shared<VideoEncoding::VVideoFrameEncoder>( ConverterFor( i_rTarget, i_rSettings ) );
  pEncoder->SetJPEGQuality( i_rTarget.m_JPEGQuality != 0 ? i_rTarget.m_JPEGQuality : i_rSettings.m_JPEGQuality );
  pEncoder->SetBurnIn( i_rSettings.m_BurnIn );
  return pEncoder;
}

// As many as there are cores; beyond a limit the disk has long been what is waited for, and each holds a frame in memory.
size_t CountWorkers() { return std::clamp( boost::thread::hardware_concurrency(), 2u, 16u ); }

std::shared_ptr<const KVZ::IBufferConst> Wrap( const VRefCountedToken& i_rFrame, const uint8_t* i_pData, size_t i_Size )
{
  return std::make_shared<ISimpleBufferWrapper>( i_rFrame, i_pData, i_Size );
}

void LogStartTimecode( const KVZ::ITimecode& i_rTimecode )
{
  if( KVZ::IsValid( i_rTimecode ) )
  {
    KVZ_LOG_DETAIL( "VideoInputDataSource", "Writing file with start timecode = %1%:%2%:%3%:%4% . %5%", i_rTimecode.m_Hours, i_rTimecode.m_Minutes,
      i_rTimecode.m_Seconds, i_rTimecode.m_Frames, i_rTimecode.m_TickRemainder );
  }
}

}

VVideoInputBufferClient::VVideoInputBufferClient( VSettings i_Settings )
  : m_Settings( std::move( i_Settings ) ),
    m_pPostalService( m_Settings.m_pPostalService ? m_Settings.m_pPostalService
                                                  : std::make_shared<NotificationSystem::VAsioPostalService>( "VVideoInputBufferClient" ) )
{
}

VVideoInputBufferClient::~VVideoInputBufferClient() = default;

void VVideoInputBufferClient::AddDevice( VDeviceRecord i_Device ) { m_Device = std::move( i_Device ); }

void VVideoInputBufferClient::AddFile( const StageCorePluginInterface::VCaptureTarget& i_rTarget )
{
  // An encoder for each file: writers may use theirs on threads of their own.
  auto pFile = std::make_unique<VFileRecord>( i_rTarget, m_Settings.m_Encoder,
    m_Settings.m_pWriterFactory->Make( static_cast<KVZ::IVideoContainer::Enum>( i_rTarget.m_Container ),
      MakeEncoder( m_Settings.m_Encoder, i_rTarget ) ) );
  pFile->Report().m_CaptureSessionId = m_Settings.m_Header.m_CaptureSessionId;
  pFile->Report().m_DeviceURN = m_Device.m_URN;
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( pFile->IsParallel() && !m_pWorkers )
  {
    MakeWorkers();
  }
  m_Files.push_back( std::move( pFile ) );
}

// Twice as many frames as threads, so that none waits for the client's thread.
size_t VVideoInputBufferClient::FramesAtOnce() { return 2 * CountWorkers(); }

void VVideoInputBufferClient::MakeWorkers()
{
  m_pFrameService = m_Settings.m_pFrameService ? m_Settings.m_pFrameService : std::make_shared<VWorkerThreads>( "Image Writer", CountWorkers() );
  m_pWorkers = std::make_unique<VFrameWorkers>( m_pFrameService, FramesAtOnce(), MakeWake() );
}

// Posts a turn of the client's thread. What calls it must not be what ends the client, so it holds the client weakly even while it posts.
std::function<void()> VVideoInputBufferClient::MakeWake()
{
  return [pService = m_pPostalService, pWeak = weak_from_this()]
  {
    pService->Post(
      [pWeak]
      {
        if( const auto pThis = pWeak.lock() )
        {
          pThis->WriteFrames();
        }
      } );
  };
}

// The buffer wakes the client with its own lock held.
void VVideoInputBufferClient::Start() { m_ClientId = m_Settings.m_pBuffer->RegisterClient( MakeWake() ); }

void VVideoInputBufferClient::Stop()
{
  m_Settings.m_pBuffer->UnregisterClient( m_ClientId );
  VNews News;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bEnded = true;
    DropJobs();
    CloseFiles( News );
  }
  Tell( News );
}

// The client's thread.
void VVideoInputBufferClient::WriteFrames()
{
  for( bool bGoOn = true; bGoOn; )
  {
    VNews News;
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      if( m_bEnded )
      {
        return;
      }
      TakeTurn( News );
    }
    Tell( News );
    bGoOn = News.m_bGoOn;
  }
}

void VVideoInputBufferClient::TakeTurn( VNews& o_rNews )
{
  if( !CountDone() )
  {
    m_Ending = EEnding::Failed;
    DropJobs();
  }
  if( m_Ending == EEnding::None )
  {
    TakeFrame( o_rNews );
  }
  if( m_Ending != EEnding::None && ( !m_pWorkers || m_pWorkers->IsIdle() ) )
  {
    End( o_rNews );
  }
}

void VVideoInputBufferClient::TakeFrame( VNews& o_rNews )
{
  if( m_pWorkers && !m_pWorkers->HasRoom() )
  {
    return;   // the worker that makes room comes back here
  }
  VRefCountedToken Frame;
  SyncSystem::VClientRead Read;
  if( !m_Settings.m_pBuffer->ClientNextFrame( m_ClientId, Frame, Read ) )
  {
    return;
  }
  if( Frame && !TryWriteFrame( Frame ) )
  {
    m_Ending = EEnding::Failed;
    return;
  }
  o_rNews.m_bGoOn = Read.m_Result == EClientResult::MoreToCome;
  if( Read.m_Result == EClientResult::Finished )
  {
    m_Ending = EEnding::Finished;
  }
  else if( Read.m_Result == EClientResult::Cancelled )
  {
    m_Ending = EEnding::Cancelled;
    DropJobs();
  }
}

// Takes note of what the workers have written. False once a file has failed there.
bool VVideoInputBufferClient::CountDone()
{
  bool bGood = true;
  for( const VFrameWorkers::VDone& rDone : m_pWorkers ? m_pWorkers->TakeDone() : std::vector<VFrameWorkers::VDone>() )
  {
    bGood = m_Files[rDone.m_File]->Count( rDone.m_Outcome ) && bGood;
  }
  return bGood;
}

// Jobs begin in order, so that what is left of the sequence has no gap.
void VVideoInputBufferClient::DropJobs()
{
  if( m_pWorkers )
  {
    m_pWorkers->DropAndWait();
    CountDone();
  }
}

// The client's last turn.
void VVideoInputBufferClient::End( VNews& o_rNews )
{
  o_rNews.m_bGoOn = false;
  o_rNews.m_Failure = m_Failure;
  CloseFiles( o_rNews );
  if( m_Ending == EEnding::Finished )
  {
    o_rNews.m_bFinished = true;
    LogEnd( "Client %1% finished writing %2% seconds of data." );
  }
  else if( m_Ending == EEnding::Cancelled )
  {
    LogEnd( "Client %1% cancelled after writing %2% seconds of data." );
  }
  m_bEnded = true;
}

// Memory that runs out outside of a writer ends the capture as any other failure does.
bool VVideoInputBufferClient::TryWriteFrame( const VRefCountedToken& i_rFrame )
{
  try
  {
    return WriteFrame( i_rFrame );
  }
  catch( const std::exception& i_rException )
  {
    m_Failure = std::string( "A frame could not be prepared for its files: " ) + i_rException.what();
    return false;
  }
}

// The pin of the token is the client's until this returns; whoever keeps a buffer of it keeps a pin with it.
bool VVideoInputBufferClient::WriteFrame( const VRefCountedToken& i_rFrame )
{
  VFrameView View;
  View.m_pFrame = VVideoInputDataSource::FrameOf( i_rFrame.Frame() );
  m_Settings.m_pSession->TickAt( i_rFrame.Token(), View.m_Tick );
  View.m_Period = m_Settings.m_pSession->m_Session.m_Period;
  if( !Begin( View ) )
  {
    return false;
  }
  if( View.m_pFrame )
  {
    View.m_pVideo = Wrap( i_rFrame, View.m_pFrame->Image(), View.m_pFrame->m_ImageBytes );
    View.m_pAudio = View.m_pFrame->m_AudioBytes != 0 ? Wrap( i_rFrame, View.m_pFrame->Audio(), View.m_pFrame->m_AudioBytes ) : nullptr;
  }
  for( size_t File = 0; File < m_Files.size(); ++File )
  {
    if( !WriteToFile( File, View ) )
    {
      m_Failure = m_Files[File]->Error();
      return false;
    }
  }
  return true;
}

bool VVideoInputBufferClient::WriteToFile( size_t i_File, const VFrameView& i_rFrame )
{
  VFileRecord& rFile = *m_Files[i_File];
  uint64_t Key = 0;
  if( !rFile.Prepare( i_rFrame, m_Settings, m_Device, Key ) )
  {
    return false;
  }
  if( !rFile.IsParallel() )
  {
    return rFile.Count( rFile.WriteFrame( i_rFrame, Key ) );
  }
  m_pWorkers->Add( i_File, [&rFile, View = i_rFrame, Key] { return rFile.WriteFrame( View, Key ); } );
  return true;
}

// Makes the files when the first frame comes.
bool VVideoInputBufferClient::Begin( const VFrameView& i_rFrame )
{
  if( m_bStarted )
  {
    return true;
  }
  m_bStarted = true;
  m_bFilesOpen = true;
  if( i_rFrame.m_pFrame )
  {
    LogStartTimecode( i_rFrame.m_pFrame->m_Timecode );
  }
  return CreateFiles();
}

bool VVideoInputBufferClient::CreateFiles()
{
  const auto Failed = std::find_if( m_Files.begin(), m_Files.end(), []( const auto& i_rpFile ) { return !i_rpFile->Create(); } );
  if( Failed == m_Files.end() )
  {
    return true;
  }
  m_Failure = ( *Failed )->Error();
  return false;
}

// Files that never began are not spoken of.
void VVideoInputBufferClient::CloseFiles( VNews& o_rNews )
{
  m_Frames = m_Files.empty() ? m_Frames : std::numeric_limits<uint64_t>::max();
  for( const auto& pFile : m_Files )
  {
    pFile->Close();
    m_Frames = std::min( m_Frames, pFile->Report().m_FramesWritten );
    if( pFile->HasFailed() && o_rNews.m_Failure.empty() )
    {
      o_rNews.m_Failure = pFile->Error();
    }
    if( m_bStarted )
    {
      o_rNews.m_Reports.push_back( pFile->Report() );
    }
  }
  m_Files.clear();
}

void VVideoInputBufferClient::LogEnd( const char* i_pFormat ) const
{
  KVZ_LOG_DETAIL( "VideoInputDataSource", i_pFormat, m_ClientId,
    ( m_Settings.m_pSession->m_Session.m_Period * static_cast<int64_t>( m_Frames ) ).Seconds() );
}

// Files are reported before the capture hears of the client's end: who sees it complete finds all reports.
void VVideoInputBufferClient::Tell( const VNews& i_rNews )
{
  if( m_Settings.m_pCaptureTargets )
  {
    for( const auto& rReport : i_rNews.m_Reports )
    {
      m_Settings.m_pCaptureTargets->OnFileFinished( rReport );
    }
  }
  if( !i_rNews.m_Reports.empty() )
  {
    m_bFilesOpen = false;
  }
  if( !i_rNews.m_Failure.empty() )
  {
    m_Settings.m_pBuffer->ClientFinished( m_ClientId, SyncSystem::ECaptureFailure::ReportedErrors,
      SyncSystem::VCaptureError{ SyncSystem::ECaptureFailure::ReportedErrors, i_rNews.m_Failure }, true );
  }
  else if( i_rNews.m_bFinished )
  {
    VRefCountedToken None;
    SyncSystem::VClientRead Read;
    m_Settings.m_pBuffer->ClientNextFrame( m_ClientId, None, Read );
  }
}

}
