#include "FileIO/WriterSupport/WriterBase.h"

#include "Core/VideoInterface/EnumTable.h"

namespace WriterSupport
{

bool VWriterBase::Open( const std::string& i_rPath )
{
  if( IsOpen() )
  {
    KVZ_LOG_ERROR( m_rCategory, "File already open." );
    return false;
  }
  const bool bOpen = Guarded( "Open", [&] { return DoOpen( i_rPath ); } );
  m_State = bOpen ? EState::Opened : EState::New;
  return bOpen;
}

bool VWriterBase::CheckHeader( const VHeader& i_rHeader ) const
{
  if( !IsOpen() )
  {
    KVZ_LOG_ERROR( m_rCategory, "File must be opened for write access before WriteHeader is called." );
    return false;
  }
  const KVZ::IVideoWriterCapabilities& rCapabilities = GetCapabilities();
  if( !rCapabilities.IsVideoPayloadSupported( i_rHeader.m_VideoPayload ) )
  {
    KVZ_LOG_ERROR( m_rCategory, "Video payload format '%1%' is not supported.", KVZ::NameOrUnspecified( i_rHeader.m_VideoPayload ) );
    return false;
  }
  const bool bUncompressedVideo = i_rHeader.m_VideoPayload == KVZ::IVideoPayload::EUncompressed;
  if( bUncompressedVideo && !rCapabilities.IsPixelFormatSupported( i_rHeader.m_rVideo.m_PixelFormat ) )
  {
    KVZ_LOG_ERROR( m_rCategory, "Pixel format '%1%' is not supported for uncompressed video.",
      KVZ::NameOrUnspecified( i_rHeader.m_rVideo.m_PixelFormat ) );
    return false;
  }
  if( !rCapabilities.IsAudioPayloadSupported( i_rHeader.m_AudioPayload ) )
  {
    KVZ_LOG_ERROR( m_rCategory, "Audio payload format '%1%' is not supported.", KVZ::NameOrUnspecified( i_rHeader.m_AudioPayload ) );
    return false;
  }
  const bool bUncompressedAudio = i_rHeader.m_AudioPayload == KVZ::IAudioPayload::EUncompressed && !i_rHeader.m_rAudio.IsEmpty();
  if( bUncompressedAudio && !rCapabilities.IsAudioSampleFormatSupported( i_rHeader.m_rAudio.m_SampleFormat ) )
  {
    KVZ_LOG_ERROR( m_rCategory, "Audio sample format '%1%' is not supported for uncompressed audio.",
      KVZ::NameOrUnspecified( i_rHeader.m_rAudio.m_SampleFormat ) );
    return false;
  }
  return true;
}

bool VWriterBase::WriteHeader( const KVZ::VideoFrameInfo& i_rVideoInfo, const KVZ::AudioFrameInfo& i_rAudioInfo, const KVZ::VTimingRecord& i_rTiming,
  const KVZ::ITimecode& i_rTimecode, const KVZ::VColourRecord& i_rColour, const KVZ::IVideoAttributes& i_rAttributes,
  KVZ::IVideoPayload::Enum i_VideoPayload, KVZ::IAudioPayload::Enum i_AudioPayload )
{
  const VHeader Header{ i_rVideoInfo, i_rAudioInfo, i_rTiming, i_rTimecode, i_rColour, i_rAttributes, i_VideoPayload, i_AudioPayload };
  if( !CheckHeader( Header ) )
  {
    return false;
  }
  if( m_State != EState::Opened )
  {
    KVZ_LOG_ERROR( m_rCategory, "WriteHeader must be called once only." );
    return false;
  }
  m_State = EState::HeaderFailed;
  if( Guarded( "WriteHeader", [&] { return DoWriteHeader( Header ); } ) )
  {
    m_State = EState::Headed;
  }
  return IsHeaded();
}

bool VWriterBase::WriteFrame( const KVZ::VFrameSet& i_rFrameSet, uint64_t i_FrameKey )
{
  return Guarded( "WriteFrame",
    [&]
    {
      KVZ::VBufferList Video;
      if( i_rFrameSet.m_pVideo )
      {
        Video.push_back( i_rFrameSet.m_pVideo );
      }
      KVZ::VBufferList Audio = i_rFrameSet.m_Audio;
      return WriteFrame( Video, i_rFrameSet.m_VideoInfo, Audio, i_rFrameSet.m_AudioInfo, i_FrameKey );
    } );
}

bool VWriterBase::WriteFrame( KVZ::VBufferList& io_rVideo, const KVZ::VideoFrameInfo& i_rVideoInfo, KVZ::VBufferList& io_rAudio,
  const KVZ::AudioFrameInfo& i_rAudioInfo, uint64_t i_FrameKey )
{
  if( !IsOpen() || !IsHeaded() )
  {
    KVZ_LOG_ERROR( m_rCategory, "WriteHeader must be called before WriteFrame is called." );
    return false;
  }
  VFrame Frame{ io_rVideo, i_rVideoInfo, io_rAudio, i_rAudioInfo, i_FrameKey };
  return Guarded( "WriteFrame", [&] { return DoWriteFrame( Frame ); } );
}

bool VWriterBase::Close()
{
  return IsOpen() && Guarded( "Close", [&] { return DoClose(); } );
}

}
