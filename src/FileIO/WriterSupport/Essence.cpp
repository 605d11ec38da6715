#include "FileIO/WriterSupport/Essence.h"

#include "Core/VideoInterface/EnumTable.h"
#include "FileIO/AudioEncoding/AudioEncoding.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"

namespace WriterSupport
{

VEssence::VEssence( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder )
  : m_pAllocator( std::make_shared<KVZ::IStandardBufferAllocator>( "Unnamed" ) ),
    m_pEncoder( i_pEncoder ? std::move( i_pEncoder ) : std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software ) )
{
}

void VEssence::Store( const VHeader& i_rHeader )
{
  m_VideoPayload = i_rHeader.m_VideoPayload;
  m_AudioPayload = i_rHeader.m_AudioPayload;
  m_Video = i_rHeader.m_rVideo;
  m_Audio = i_rHeader.m_rAudio;
  // H.264 comes as it is stored.
  if( m_VideoPayload != KVZ::IVideoPayload::EVideoH264 )
  {
    VideoEncoding::PixelFormatForPayloadFormat( m_VideoPayload, i_rHeader.m_rVideo.m_PixelFormat, m_Video.m_PixelFormat );
  }
  bool bConversionNeeded = false;
  AudioEncoding::SampleFormatForPayloadFormat( m_AudioPayload, i_rHeader.m_rAudio.m_SampleFormat, m_Audio.m_SampleFormat, bConversionNeeded );
  if( m_Audio.m_SampleFormat == KVZ::IAudioSampleFormat::EUnspecified )
  {
    m_Audio = {};
  }
}

bool VEssence::Encode( VFrame& io_rFrame, const KVZ::VLogCategory& i_rCategory )
{
  if( !m_pEncoder->Encode( *m_pAllocator, io_rFrame.m_rVideo, io_rFrame.m_rVideoInfo, m_VideoPayload, m_Video.m_PixelFormat ) )
  {
    KVZ_LOG_ERROR( i_rCategory, "Encoding to '%s' failed.", KVZ::NameOrUnspecified( m_VideoPayload ) );
    return false;
  }
  if( !m_Audio.HasAudio() )
  {
    io_rFrame.m_rAudio.clear();
    return true;
  }
  if( !AudioEncoding::EncodeIfRequired( *m_pAllocator, io_rFrame.m_rAudio, io_rFrame.m_rAudioInfo, m_AudioPayload, m_Audio.m_SampleFormat,
        m_Audio.m_Channels ) )
  {
    KVZ_LOG_ERROR( i_rCategory, "Encoding to '%s' failed.", KVZ::NameOrUnspecified( m_AudioPayload ) );
    return false;
  }
  return true;
}

bool VEssence::HasStoredSize( const VFrame& i_rFrame, const KVZ::VLogCategory& i_rCategory ) const
{
  const KVZ::VideoFrameInfo& rInfo = i_rFrame.m_rVideoInfo;
  if( rInfo.m_ImageWidth != m_Video.m_ImageWidth || rInfo.m_ImageHeight != m_Video.m_ImageHeight )
  {
    KVZ_LOG_ERROR( i_rCategory, "A frame of %1% x %2% pixels does not fit the file's %3% x %4%.", rInfo.m_ImageWidth, rInfo.m_ImageHeight,
      m_Video.m_ImageWidth, m_Video.m_ImageHeight );
    return false;
  }
  return true;
}

}
