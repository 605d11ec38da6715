#include "FileIO/RapidAVI/Writer.h"

#include "CoreVideoUtils/FrameSize.h"
#include "FileIO/RapidAVI/JPEGImage.h"
#include "FileIO/WriterSupport/AttributeBlock.h"
#include "FileIO/WriterSupport/BufferSpans.h"

#include <limits>

namespace RapidAVI
{

VRapidAVIWriter::VRapidAVIWriter( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder, WriterSupport::VStreamMaker i_StreamMaker,
  const VSegmentLimits& i_rLimits )
  : VWriterBase( "RapidAVI" ), m_StreamMaker( std::move( i_StreamMaker ) ), m_Limits( i_rLimits ), m_Essence( std::move( i_pEncoder ) )
{
}

bool VRapidAVIWriter::DoOpen( const std::string& i_rPath )
{
  std::unique_ptr<UtilsIO::IClosableStream> pStream = m_StreamMaker( i_rPath );
  if( !pStream )
  {
    KVZ_LOG_ERROR( Category(), "File could not be opened." );
    return false;
  }
  m_pOut = std::make_unique<VChunkWriter>( std::move( pStream ) );
  m_AudioSampleFrames = 0;
  return true;
}

bool VRapidAVIWriter::DoWriteHeader( const WriterSupport::VHeader& i_rHeader )
{
  m_Essence.Store( i_rHeader );
  const VFileDescription File = Describe( i_rHeader );
  if( !EncodeAttributes( i_rHeader ) || !FitsHeaders( File ) )
  {
    return false;
  }
  m_Index.emplace( File.m_Audio.HasAudio() ? std::vector{ GetVideoChunkId( File ), AudioChunkId } : std::vector{ GetVideoChunkId( File ) } );
  m_Segments.emplace( *m_pOut, *m_Index, m_Limits );
  return m_pOut->OpenRiff( FourCC( "AVI " ) ) && WriteHeaderList( *m_pOut, File, m_Fields ) && m_Segments->Begin();
}

// A stream of sound without a format or a rate would make readers refuse the whole file.
VFileDescription VRapidAVIWriter::Describe( const WriterSupport::VHeader& i_rHeader ) const
{
  if( i_rHeader.m_AudioPayload != KVZ::IAudioPayload::ENone && !m_Essence.Audio().HasAudio() )
  {
    KVZ_LOG_WARNING( "AVIIO", "Unsupported audio payload when writing AVI file." );
  }
  return { m_Essence.VideoPayload(), m_Essence.Video(), m_Essence.Audio(), i_rHeader.m_rTiming };
}

bool VRapidAVIWriter::EncodeAttributes( const WriterSupport::VHeader& i_rHeader )
{
  const WriterSupport::VRecordingDescription Recording{ i_rHeader.m_rAttributes, i_rHeader.m_rTiming, i_rHeader.m_rColour, i_rHeader.m_rTimecode,
    WriterSupport::ETimingKeys::WhenNotDefault, WriterSupport::ETimecodeKeys::Always };
  return WriterSupport::EncodeAttributes( m_Essence.Video(), m_Essence.Audio(), Recording, Category(), m_Attributes );
}

bool VRapidAVIWriter::DoWriteFrame( WriterSupport::VFrame& io_rFrame )
{
  if( !m_Segments->IsWhole() || !CheckFrame( io_rFrame ) || !m_Essence.Encode( io_rFrame, Category() ) || !CollectVideo( io_rFrame ) )
  {
    return false;
  }
  const uint64_t SampleFrames = CountSampleFrames( io_rFrame.m_rAudio );
  if( !CheckCounts( SampleFrames ) || !m_Segments->WriteFrame( m_Video, io_rFrame.m_rAudio ) )
  {
    return false;
  }
  m_AudioSampleFrames += SampleFrames;
  return true;
}

bool VRapidAVIWriter::CheckFrame( const WriterSupport::VFrame& i_rFrame ) const
{
  const uint64_t Next = m_Index->CountFrames();
  if( i_rFrame.m_Key != AppendKey && i_rFrame.m_Key != Next )
  {
    KVZ_LOG_ERROR( Category(), "Frame %1% cannot be stored where frame %2% comes next.", i_rFrame.m_Key, Next );
    return false;
  }
  return m_Essence.HasStoredSize( i_rFrame, Category() );
}

bool VRapidAVIWriter::CollectVideo( const WriterSupport::VFrame& i_rFrame )
{
  m_Video.clear();
  if( m_Essence.VideoPayload() == KVZ::IVideoPayload::EImageJPEG )
  {
    if( i_rFrame.m_rVideo.size() != 1 )
    {
      KVZ_LOG_ERROR( Category(), "Can't cope with JPEG split across buffers" );
      return false;
    }
    return MakeAVI1Image( *i_rFrame.m_rVideo.front(), m_Essence.Video().m_PixelFormat, m_Video );
  }
  const uint64_t Bytes = KVZ::GetTotalSize( i_rFrame.m_rVideo );
  const uint64_t StoredBytes = CoreVideoUtils::GetFrameSize( m_Essence.Video() );
  if( Bytes != StoredBytes )
  {
    KVZ_LOG_ERROR( Category(), "Frame %1% of %2% bytes does not fit the file's %3%.", i_rFrame.m_Key, Bytes, StoredBytes );
    return false;
  }
  WriterSupport::AppendSpans( m_Video, i_rFrame.m_rVideo );
  return true;
}

uint64_t VRapidAVIWriter::CountSampleFrames( const KVZ::VBufferList& i_rAudio ) const
{
  const KVZ::AudioFrameInfo& rAudio = m_Essence.Audio();
  uint64_t Count = 0;
  for( const auto& rpBuffer : i_rAudio )
  {
    Count += rpBuffer->Size() / KVZ::GetBytesPerSample( rAudio.m_SampleFormat ) / rAudio.m_Channels;
  }
  return Count;
}

// The headers count in 32 bits. At 48000 samples a second the sound comes to its end after 24.8 hours.
bool VRapidAVIWriter::CheckCounts( uint64_t i_MoreSampleFrames ) const
{
  constexpr uint64_t Limit = std::numeric_limits<uint32_t>::max();
  if( m_Index->CountFrames() == Limit )
  {
    KVZ_LOG_ERROR( Category(), "The file is full: it can count no more than %1% frames.", Limit );
    return false;
  }
  if( m_AudioSampleFrames + i_MoreSampleFrames > Limit )
  {
    KVZ_LOG_ERROR( Category(), "The file is full: it can count no more than %1% samples of sound.", Limit );
    return false;
  }
  return true;
}

bool VRapidAVIWriter::DoClose()
{
  const std::unique_ptr<VChunkWriter> pOut = std::move( m_pOut );
  if( !IsHeaded() )
  {
    pOut->Close();
    return false;
  }
  VChunkWriter::VMark End;
  const bool bFinished = m_Segments->Finish() && pOut->GetMark( End );
  const bool bFilled = FillOpenFields( *pOut, m_Fields, *m_Index, static_cast<uint32_t>( m_AudioSampleFrames ) );
  const bool bDescribed = bFinished && pOut->GoBack( End ) && WriteAttributes( *pOut );
  return pOut->Close() && bFinished && bFilled && bDescribed;
}

bool VRapidAVIWriter::WriteAttributes( VChunkWriter& io_rOut ) const
{
  VChunkScope Riff = VChunkScope::Riff( io_rOut, FourCC( "TMSL" ) );
  return WriterSupport::WriteAttributeBlock( io_rOut, m_Attributes.m_Internal ) &&
    WriterSupport::WriteAttributeBlock( io_rOut, m_Attributes.m_External ) && Riff.Close();
}

}
