#include "FileIO/MovIO/MovWriter.h"

#include "FileIO/MovIO/FileAtoms.h"
#include "FileIO/MovIO/FrameContent.h"
#include "FileIO/MovIO/MovTiming.h"
#include "FileIO/MovIO/MovieAtoms.h"
#include "FileIO/WriterSupport/AttributeMaps.h"

#include <limits>

namespace MovIO
{

namespace
{

constexpr uint64_t FieldLimit = std::numeric_limits<uint32_t>::max();   // of counts, sizes and durations
constexpr uint32_t ShortFieldLimit = std::numeric_limits<uint16_t>::max();

void AppendNumber( std::vector<uint8_t>& o_rBytes, uint64_t i_Number )
{
  for( int Shift = 24; Shift >= 0; Shift -= 8 )
  {
    o_rBytes.push_back( static_cast<uint8_t>( i_Number >> Shift ) );
  }
}

// Bytes of what was appended.
uint64_t AppendSpans( VMovWriter::VSpans& o_rSpans, const VMovWriter::VSpans& i_rSpans )
{
  uint64_t Size = 0;
  for( const auto& rSpan : i_rSpans )
  {
    if( rSpan.second != 0 )
    {
      o_rSpans.push_back( rSpan );
      Size += rSpan.second;
    }
  }
  return Size;
}

VMovWriter::VSpans SpansOf( const KVZ::VBufferList& i_rBuffers )
{
  VMovWriter::VSpans Spans;
  Spans.reserve( i_rBuffers.size() );
  for( const auto& rpBuffer : i_rBuffers )
  {
    Spans.emplace_back( rpBuffer->Data(), rpBuffer->Size() );
  }
  return Spans;
}

}

VMovWriter::VMovWriter( KVZ::IVideoContainer::Enum i_Container, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder,
  WriterSupport::VStreamMaker i_StreamMaker )
  : VWriterBase( "MovIO" ), m_Container( i_Container ), m_StreamMaker( std::move( i_StreamMaker ) ), m_Essence( std::move( i_pEncoder ) )
{
}

bool VMovWriter::DoOpen( const std::string& i_rPath )
{
  if( m_Container != KVZ::IVideoContainer::EMOV && m_Container != KVZ::IVideoContainer::EMP4 )
  {
    KVZ_LOG_ERROR( Category(), "Container must be MOV or MP4." );
    return false;
  }
  std::unique_ptr<UtilsIO::IClosableStream> pFile = m_StreamMaker( i_rPath );
  if( !pFile )
  {
    return false;
  }
  auto pStream = std::make_shared<WriterSupport::VWatchedStream>( std::move( pFile ) );
  m_pOut = std::make_unique<VMovPrimitiveWriter>( pStream );
  m_pStream = std::move( pStream );
  return true;
}

bool VMovWriter::DoWriteHeader( const WriterSupport::VHeader& i_rHeader )
{
  if( !m_Capabilities.IsChannelCountSupported( i_rHeader.m_rAudio.m_Channels ) )
  {
    KVZ_LOG_ERROR( Category(), "Cannot support %d channels of audio.", i_rHeader.m_rAudio.m_Channels );
    return false;
  }
  KVZ::VTimingRecord Timing;
  uint32_t TimecodeFrame = 0;
  if( !Describe( i_rHeader, Timing ) || !SetUpTracks( Timing.m_FramePeriodInTicks, i_rHeader.m_rTimecode, TimecodeFrame ) )
  {
    return false;
  }
  return WriteStart( TimecodeFrame );
}

bool VMovWriter::Describe( const WriterSupport::VHeader& i_rHeader, KVZ::VTimingRecord& o_rTiming )
{
  m_Essence.Store( i_rHeader );
  std::vector<uint8_t> SPS = std::move( m_Movie.m_SPS );
  m_Movie = {};
  m_Movie.m_SPS = std::move( SPS );
  m_Movie.m_Container = m_Container;
  m_Movie.m_VideoPayload = i_rHeader.m_VideoPayload;
  m_Movie.m_AudioPayload = m_Essence.Audio().HasAudio() ? i_rHeader.m_AudioPayload : KVZ::IAudioPayload::ENone;
  m_Movie.m_VideoInfo = i_rHeader.m_rVideo;
  m_Movie.m_AudioInfo = i_rHeader.m_rAudio;
  // A description with gaps is no error in this container: its keys are left out.
  WriterSupport::EncodeInternalAttributes( i_rHeader.m_rVideo, i_rHeader.m_rAudio, m_Movie.m_Internal );
  if( !ToBaseTicks( i_rHeader.m_rTiming, o_rTiming ) )
  {
    KVZ_LOG_ERROR( Category(), "A frame period of %1% ticks of 1/%2% s cannot be represented in 32 bits at %3% Hz.",
      i_rHeader.m_rTiming.m_FramePeriodInTicks, i_rHeader.m_rTiming.m_TicksPerSecond, BaseTicksPerSecond );
    return false;
  }
  return WriterSupport::EncodeExternalAttributes( { i_rHeader.m_rAttributes, o_rTiming, i_rHeader.m_rColour, i_rHeader.m_rTimecode },
           m_Movie.m_External ) &&
    HasFieldsForDescription();
}

bool VMovWriter::HasFieldsForDescription() const
{
  const KVZ::VideoFrameInfo& rVideo = m_Movie.m_VideoInfo;
  if( rVideo.m_ImageWidth > ShortFieldLimit || rVideo.m_ImageHeight > ShortFieldLimit )
  {
    KVZ_LOG_ERROR( Category(), "An image of %1% x %2% pixels is larger than the %3% x %3% that the file can say.", rVideo.m_ImageWidth,
      rVideo.m_ImageHeight, ShortFieldLimit );
    return false;
  }
  const bool bShortRate = m_Movie.m_AudioInfo.m_SampleFormat == KVZ::IAudioSampleFormat::EUInt8;
  if( m_Movie.HasAudio() && bShortRate && m_Movie.m_AudioInfo.m_SampleRate > ShortFieldLimit )
  {
    KVZ_LOG_ERROR( Category(), "A sample rate of %1% is more than the %2% that the file can say of 8-bit samples.", m_Movie.m_AudioInfo.m_SampleRate,
      ShortFieldLimit );
    return false;
  }
  return true;
}

bool VMovWriter::SetUpTracks( uint32_t i_VideoPeriod, const KVZ::ITimecode& i_rTimecode, uint32_t& o_rTimecodeFrame )
{
  m_Movie.m_Timecode = GetStartTimecode( i_rTimecode, i_VideoPeriod );
  VPeriods Periods;
  Periods.m_Video = i_VideoPeriod;
  Periods.m_Timecode = GetTimecodePeriod( m_Movie.m_Timecode.m_Standard );
  Periods.m_Audio = m_Movie.HasAudio() ? BaseTicksPerSecond / m_Movie.m_AudioInfo.m_SampleRate : 0;
  const bool bReduced = Reduce( Periods );
  if( !bReduced || ( m_Movie.IsH264() && CompositionFrames * Periods.m_Video + Periods.m_Timecode > FieldLimit ) )
  {
    KVZ_LOG_ERROR( Category(), "Video frame period, timecode period or audio sample period cannot be represented in 32 bits." );
    return false;
  }
  m_Movie.m_Timescale = static_cast<uint32_t>( Periods.m_Timescale );
  m_Movie.m_Video.m_SamplePeriod = static_cast<uint32_t>( Periods.m_Video );
  m_Movie.m_Audio.m_SamplePeriod = static_cast<uint32_t>( Periods.m_Audio );
  m_Movie.m_TimecodeTrack.m_SamplePeriod = static_cast<uint32_t>( Periods.m_Timecode );
  for( VTrack* pTrack : { &m_Movie.m_Video, &m_Movie.m_Audio, &m_Movie.m_TimecodeTrack } )
  {
    pTrack->m_Timescale = m_Movie.m_Timescale;
  }
  VTimecodeStart Start;
  const bool bTimecode = GetTimecodeStart( m_Movie.m_Timecode, m_Movie.m_Timescale, Start );
  m_Movie.m_TimecodeRemainder = Start.m_Remainder;
  o_rTimecodeFrame = Start.m_FrameNumber;
  return bTimecode;
}

// The timecode's one sample is the first of the media data.
bool VMovWriter::WriteStart( uint32_t i_TimecodeFrame )
{
  if( !WriteFtyp( *m_pOut, m_Movie ) )
  {
    return false;
  }
  m_Movie.m_MdatPosition = m_pOut->Tell();
  WriteMdatHeader( *m_pOut );
  m_Movie.m_TimecodePosition = m_pOut->Tell();
  m_Movie.m_TimecodeTrack.m_ChunkCount = 1;
  m_pOut->U32( i_TimecodeFrame );
  m_End = m_pOut->Tell();
  return m_pOut->Flush();
}

bool VMovWriter::SetSPS( const std::vector<uint8_t>& i_rSPS )
{
  return Guarded( "SetSPS",
    [&]
    {
      if( !m_Movie.m_SPS.empty() && m_Movie.m_SPS != i_rSPS )
      {
        KVZ_LOG_ERROR( Category(), "SPS has changed mid-way through movie." );
        return false;
      }
      const bool bFits = i_rSPS.size() <= ShortFieldLimit;
      m_Movie.m_SPS = bFits ? i_rSPS : m_Movie.m_SPS;
      return bFits;
    } );
}

bool VMovWriter::SetPPS( const std::vector<uint8_t>& i_rPPS )
{
  return Guarded( "SetPPS",
    [&]
    {
      const bool bAccepted = m_Movie.IsH264() && i_rPPS.size() <= ShortFieldLimit;
      m_Movie.m_PPS = bAccepted ? i_rPPS : m_Movie.m_PPS;
      return bAccepted;
    } );
}

bool VMovWriter::WriteStoredFrame( const VSpans& i_rVideo, const VSpans& i_rAudio, char i_FrameType )
{
  if( !IsOpen() || !IsHeaded() )
  {
    KVZ_LOG_ERROR( Category(), "WriteHeader must be called before WriteFrame is called." );
    return false;
  }
  return Guarded( "WriteStoredFrame", [&] { return WriteSample( i_rVideo, i_rAudio, i_FrameType ); } );
}

bool VMovWriter::DoWriteFrame( WriterSupport::VFrame& io_rFrame )
{
  if( io_rFrame.m_Key != AppendKey && io_rFrame.m_Key != m_Movie.m_Frames.size() )
  {
    return false;
  }
  return m_Essence.HasStoredSize( io_rFrame, Category() ) && m_Essence.Encode( io_rFrame, Category() ) &&
    WriteSample( SpansOf( io_rFrame.m_rVideo ), SpansOf( io_rFrame.m_rAudio ), 'I' );
}

bool VMovWriter::WriteSample( const VSpans& i_rVideo, const VSpans& i_rAudio, char i_FrameType )
{
  if( !m_pOut->IsOk() || !IsContentOf( m_Movie, i_rVideo, i_FrameType ) )
  {
    return false;
  }
  const uint64_t Size = CollectVideo( i_rVideo );
  if( Size > FieldLimit )
  {
    m_End = m_pOut->Write( m_Spans ) ? m_pOut->Tell() : m_End;
    KVZ_LOG_ERROR( Category(), "Video frames of more than 2^32 bytes are not permitted." );
    return false;
  }
  const uint64_t AudioSamples = CollectAudio( i_rAudio );
  return HasSizeOfFirst( Size ) && HasRoom( AudioSamples ) &&
    WriteAndEnter( { m_pOut->Tell(), static_cast<uint32_t>( Size ), static_cast<uint32_t>( AudioSamples ), i_FrameType } );
}

// Where memory runs out behind the write, the frame is missing in the tables and its bytes are nobody's.
bool VMovWriter::WriteAndEnter( const VFrameEntry& i_rEntry )
{
  if( !m_pOut->Write( m_Spans ) )
  {
    return false;
  }
  m_Movie.m_Frames.push_back( i_rEntry );
  m_End = m_pOut->Tell();
  m_Movie.m_Video.AddChunk( 1 );
  if( i_rEntry.m_AudioSamples != 0 )
  {
    m_Movie.m_Audio.AddChunk( i_rEntry.m_AudioSamples );
  }
  m_Movie.m_TimecodeTrack.m_SampleCount = 1;
  m_Movie.m_TimecodeTrack.m_Duration = m_Movie.m_Video.m_Duration;
  m_Movie.m_TimecodeTrack.m_MediaDuration = m_Movie.m_Video.m_Duration;
  m_Movie.m_Duration = m_Movie.m_Video.m_Duration;
  return true;
}

// Replaces the spans. In front of an H.264 frame go the parameter set and the frame's own length.
uint64_t VMovWriter::CollectVideo( const VSpans& i_rVideo )
{
  m_Spans.clear();
  if( !m_Movie.IsH264() )
  {
    return AppendSpans( m_Spans, i_rVideo );
  }
  m_FramePrefix.clear();
  m_Spans.emplace_back();
  const uint64_t Size = AppendSpans( m_Spans, i_rVideo );
  AppendNumber( m_FramePrefix, m_Movie.m_PPS.size() );
  m_FramePrefix.insert( m_FramePrefix.end(), m_Movie.m_PPS.begin(), m_Movie.m_PPS.end() );
  AppendNumber( m_FramePrefix, Size );
  m_Spans.front() = { m_FramePrefix.data(), m_FramePrefix.size() };
  return Size + m_FramePrefix.size();
}

// Adds to the spans, and gives the samples that they hold.
uint64_t VMovWriter::CollectAudio( const VSpans& i_rAudio )
{
  const bool bAudio = m_Movie.HasAudio() && !i_rAudio.empty() && i_rAudio.front().second != 0;
  return bAudio ? AppendSpans( m_Spans, i_rAudio ) / m_Movie.BytesPerSampleFrame() : 0;
}

// The file says one size for all uncompressed images.
bool VMovWriter::HasSizeOfFirst( uint64_t i_Size ) const
{
  if( m_Movie.m_VideoPayload != KVZ::IVideoPayload::EUncompressed || m_Movie.m_Frames.empty() || m_Movie.m_Frames.front().m_Size == i_Size )
  {
    return true;
  }
  KVZ_LOG_ERROR( Category(), "Frame %1% has %2% bytes and cannot follow a first frame with %3%.", m_Movie.m_Frames.size(), i_Size,
    m_Movie.m_Frames.front().m_Size );
  return false;
}

bool VMovWriter::HasRoom( uint64_t i_AudioSamples ) const
{
  const uint64_t Frames = m_Movie.m_Frames.size() + 1;
  const uint64_t Samples = m_Movie.m_Audio.m_SampleCount + i_AudioSamples;
  const bool bVideo = Frames <= FieldLimit && Frames * m_Movie.m_Video.m_SamplePeriod + m_Movie.m_TimecodeRemainder <= FieldLimit;
  const bool bAudio = Samples <= FieldLimit && Samples * m_Movie.m_Audio.m_SamplePeriod <= FieldLimit;
  if( !bVideo || !bAudio )
  {
    KVZ_LOG_ERROR( Category(), "The file is full: with frame %1% its %2% track would be longer than %3% units of 1/%4% s.", Frames - 1,
      ( bVideo ? m_Movie.m_Audio : m_Movie.m_Video ).m_Name, FieldLimit, m_Movie.m_Timescale );
  }
  return bVideo && bAudio;
}

// With a primitive writer of its own: that of the frames does no more once it has failed.
bool VMovWriter::DoClose()
{
  m_pOut.reset();
  const std::shared_ptr<WriterSupport::VWatchedStream> pStream = std::move( m_pStream );
  VMovPrimitiveWriter Out( pStream );
  const bool bTables = IsHeaded() && WriteTables( Out, pStream->GetEnd() );
  return Out.Close() && bTables;
}

// They begin behind the last frame that is whole, over what a failed write has left there.
bool VMovWriter::WriteTables( VMovPrimitiveWriter& io_rOut, uint64_t i_FileEnd )
{
  const bool bMdat = PatchMdatSize( io_rOut, m_Movie, m_End );
  const bool bMoov = WriteMoov( io_rOut, m_Movie ) && bMdat && io_rOut.Flush();
  m_IncompleteFrames = bMoov ? 0 : m_Movie.m_Frames.size();
  const bool bTmsl = WriteTmsl( io_rOut, m_Movie );
  return bMoov && bTmsl && WriteFree( io_rOut, i_FileEnd );
}

}
