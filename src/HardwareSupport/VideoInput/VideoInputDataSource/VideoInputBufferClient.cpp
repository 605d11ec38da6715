#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputBufferClient.h"

#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/SimpleBufferWrapper.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputFileRecord.h"
#include "NotificationSystem/AsioPostalService.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>
#include <exception>
#include <utility>

namespace VideoInputHAL
{

using SyncSystem::EClientResult;
using SyncSystem::VRefCountedToken;

namespace
{

std::shared_ptr<VideoEncoding::VVideoFrameEncoder> MakeEncoder( const VVideoEncoderSettings& i_rSettings )
{
  auto pEncoder = std::make_shared<VideoEncoding::VVideoFrameEncoder>( i_rSettings.m_Converter );
  pEncoder->SetJPEGQuality( i_rSettings.m_JPEGQuality );
  pEncoder->SetBurnIn( i_rSettings.m_BurnIn );
  return pEncoder;
}

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
  auto pFile = std::make_unique<VFileRecord>( i_rTarget,
    m_Settings.m_pWriterFactory->Make( static_cast<KVZ::IVideoContainer::Enum>( i_rTarget.m_Container ), MakeEncoder( m_Settings.m_Encoder ) ) );
  pFile->Report().m_CaptureSessionId = m_Settings.m_Header.m_CaptureSessionId;
  pFile->Report().m_DeviceURN = m_Device.m_URN;
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Files.push_back( std::move( pFile ) );
}

void VVideoInputBufferClient::Start()
{
  // Called with the buffer's lock held. It must not be what ends the client, so it holds the client weakly even while it posts.
  m_ClientId = m_Settings.m_pBuffer->RegisterClient(
    [pService = m_pPostalService, pWeak = weak_from_this()]
    {
      pService->Post(
        [pWeak]
        {
          if( const auto pThis = pWeak.lock() )
          {
            pThis->WriteFrames();
          }
        } );
    } );
}

void VVideoInputBufferClient::Stop()
{
  m_Settings.m_pBuffer->UnregisterClient( m_ClientId );
  VNews News;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bEnded = true;
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
      TakeFrame( News );
    }
    Tell( News );
    bGoOn = News.m_bGoOn;
  }
}

void VVideoInputBufferClient::TakeFrame( VNews& o_rNews )
{
  VRefCountedToken Frame;
  SyncSystem::VClientRead Read;
  if( !m_Settings.m_pBuffer->ClientNextFrame( m_ClientId, Frame, Read ) )
  {
    return;
  }
  if( Frame && !TryWriteFrame( Frame, o_rNews ) )
  {
    CloseFiles( o_rNews );
    m_bEnded = true;
    return;
  }
  o_rNews.m_bGoOn = Read.m_Result == EClientResult::MoreToCome;
  if( Read.m_Result == EClientResult::Finished )
  {
    CloseFiles( o_rNews );
    o_rNews.m_bFinished = true;
    LogEnd( "Client %1% finished writing %2% seconds of data." );
    m_bEnded = true;
  }
  else if( Read.m_Result == EClientResult::Cancelled )
  {
    CloseFiles( o_rNews );
    LogEnd( "Client %1% cancelled after writing %2% seconds of data." );
    m_bEnded = true;
  }
}

// Memory that runs out outside of a writer ends the capture as any other failure does.
bool VVideoInputBufferClient::TryWriteFrame( const VRefCountedToken& i_rFrame, VNews& o_rNews )
{
  try
  {
    return WriteFrame( i_rFrame, o_rNews );
  }
  catch( const std::exception& i_rException )
  {
    o_rNews.m_Failure = std::string( "A frame could not be prepared for its files: " ) + i_rException.what();
    return false;
  }
}

// The pin of the token is the client's until this returns; writers that keep a buffer keep a pin with it.
bool VVideoInputBufferClient::WriteFrame( const VRefCountedToken& i_rFrame, VNews& o_rNews )
{
  VFrameView View;
  View.m_pFrame = VVideoInputDataSource::FrameOf( i_rFrame.Frame() );
  m_Settings.m_pSession->TickAt( i_rFrame.Token(), View.m_Tick );
  View.m_Period = m_Settings.m_pSession->m_Session.m_Period;
  if( !Begin( View, o_rNews ) )
  {
    return false;
  }
  if( View.m_pFrame )
  {
    View.m_pVideo = Wrap( i_rFrame, View.m_pFrame->Image(), View.m_pFrame->m_ImageBytes );
    View.m_pAudio = View.m_pFrame->m_AudioBytes != 0 ? Wrap( i_rFrame, View.m_pFrame->Audio(), View.m_pFrame->m_AudioBytes ) : nullptr;
  }
  for( const auto& pFile : m_Files )
  {
    if( !pFile->Write( View, m_Settings, m_Device ) )
    {
      o_rNews.m_Failure = pFile->Error();
      return false;
    }
  }
  ++m_Frames;
  return true;
}

// Makes the files when the first frame comes.
bool VVideoInputBufferClient::Begin( const VFrameView& i_rFrame, VNews& o_rNews )
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
  return CreateFiles( o_rNews );
}

bool VVideoInputBufferClient::CreateFiles( VNews& o_rNews )
{
  const auto Failed = std::find_if( m_Files.begin(), m_Files.end(), []( const auto& i_rpFile ) { return !i_rpFile->Create(); } );
  if( Failed == m_Files.end() )
  {
    return true;
  }
  o_rNews.m_Failure = ( *Failed )->Error();
  return false;
}

// Files that never began are not spoken of.
void VVideoInputBufferClient::CloseFiles( VNews& o_rNews )
{
  for( const auto& pFile : m_Files )
  {
    pFile->Close();
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
