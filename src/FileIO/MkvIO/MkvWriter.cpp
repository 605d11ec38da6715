#include "FileIO/MkvIO/MkvWriter.h"

#include "CoreVideoUtils/FrameSize.h"
#include "FileIO/MkvIO/Format.h"
#include "FileIO/MkvIO/Segment.h"
#include "FileIO/MkvIO/Tags.h"
#include "FileIO/MkvIO/Tracks.h"
#include "FileIO/WriterSupport/AttributeMaps.h"

#include <boost/optional.hpp>

#include <limits>

namespace MkvIO
{

namespace
{

constexpr const char* WritingApplication = "Tarvo MkvWriter";
constexpr const char* InternalPrefix = "Tarvo.Internal.";
constexpr const char* ExternalPrefix = "Tarvo.External.";

// Nanoseconds, rounded down.
boost::optional<uint32_t> FramePeriod( const KVZ::VTimingRecord& i_rTiming, const KVZ::VLogCategory& i_rCategory )
{
  if( i_rTiming.m_TicksPerSecond == 0 )
  {
    KVZ_LOG_ERROR( i_rCategory, "A rate of 0 ticks a second gives no frame period." );
    return {};
  }
  const uint64_t Period = uint64_t{ i_rTiming.m_FramePeriodInTicks } * 1000000000 / i_rTiming.m_TicksPerSecond;
  if( Period > std::numeric_limits<uint32_t>::max() )
  {
    KVZ_LOG_ERROR( i_rCategory, "A frame period of %1% ns is longer than the 4294967295 ns that can be stored.", Period );
    return {};
  }
  if( Period < TimecodeScale )
  {
    KVZ_LOG_WARNING( i_rCategory, "The frame rate is not known: all frames are stored at the same time." );
  }
  return static_cast<uint32_t>( Period );
}

// Both maps describe the file as a whole, so they name no track.
std::vector<VTagGroup> TagsOf( const WriterSupport::VAttributeMaps& i_rAttributes )
{
  std::vector<VTagGroup> Groups( 1 );
  AddAttributes( Groups.front(), InternalPrefix, i_rAttributes.m_Internal );
  AddAttributes( Groups.front(), ExternalPrefix, i_rAttributes.m_External );
  return Groups;
}

bool PrepareAudioTrack( libmatroska::KaxTracks& io_rTracks, const KVZ::AudioFrameInfo& i_rAudio )
{
  const auto Codec = FindAudioCodec( i_rAudio.m_SampleFormat );
  if( Codec )
  {
    FillAudioTrack( io_rTracks, i_rAudio, *Codec );
  }
  return Codec.has_value();
}

}

VMkvWriter::VMkvWriter( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder, WriterSupport::VStreamMaker i_StreamMaker )
  : VWriterBase( "MkvIO" ), m_StreamMaker( std::move( i_StreamMaker ) ), m_Essence( std::move( i_pEncoder ) )
{
}

VMkvWriter::~VMkvWriter() = default;

bool VMkvWriter::DoOpen( const std::string& i_rPath )
{
  std::unique_ptr<UtilsIO::IClosableStream> pStream = m_StreamMaker( i_rPath );
  if( !pStream )
  {
    KVZ_LOG_ERROR( Category(), "File could not be opened." );
    return false;
  }
  m_pFile = std::make_unique<VMkvIOCallback>( std::move( pStream ) );
  return true;
}

bool VMkvWriter::DoWriteHeader( const WriterSupport::VHeader& i_rHeader )
{
  m_Essence.Store( i_rHeader );
  const WriterSupport::VRecordingDescription Recording{ i_rHeader.m_rAttributes, i_rHeader.m_rTiming, i_rHeader.m_rColour, i_rHeader.m_rTimecode };
  WriterSupport::VAttributeMaps Attributes;
  const auto Period = FramePeriod( i_rHeader.m_rTiming, Category() );
  const auto VideoCodec = FindVideoCodec( m_Essence.VideoPayload(), m_Essence.Video().m_PixelFormat );
  if( !Period || !VideoCodec || !WriterSupport::EncodeAttributes( m_Essence.Video(), m_Essence.Audio(), Recording, Category(), Attributes ) )
  {
    return false;
  }
  libmatroska::KaxTracks Tracks;
  FillVideoTrack( Tracks, m_Essence.Video(), *VideoCodec, *Period );
  if( m_Essence.Audio().HasAudio() && !PrepareAudioTrack( Tracks, m_Essence.Audio() ) )
  {
    return false;
  }
  libmatroska::KaxTags Tags;
  FillTags( Tags, TagsOf( Attributes ) );
  m_pSegment = std::make_unique<VSegment>( *m_pFile );
  m_pSegment->Begin( { WritingApplication, *Period / TimecodeScale, Tracks, Tags } );
  return true;
}

bool VMkvWriter::DoWriteFrame( WriterSupport::VFrame& io_rFrame )
{
  if( io_rFrame.m_Key != AppendKey && io_rFrame.m_Key != m_pSegment->GetFrameCount() )
  {
    KVZ_LOG_ERROR( Category(), "Frame %1% cannot be written: the next one is %2%.", io_rFrame.m_Key, m_pSegment->GetFrameCount() );
    return false;
  }
  if( !m_Essence.HasStoredSize( io_rFrame, Category() ) || !m_Essence.Encode( io_rFrame, Category() ) )
  {
    return false;
  }
  const bool bUncompressed = m_Essence.VideoPayload() == KVZ::IVideoPayload::EUncompressed;
  if( bUncompressed && KVZ::GetTotalSize( io_rFrame.m_rVideo ) != CoreVideoUtils::GetFrameSize( m_Essence.Video() ) )
  {
    KVZ_LOG_ERROR( Category(), "Unexpected total size of buffers provided." );
    return false;
  }
  return m_pSegment->AddFrame( io_rFrame.m_rVideo, io_rFrame.m_rAudio );
}

bool VMkvWriter::DoClose()
{
  const bool bFinished = IsHeaded() && Guarded( "Close", [&] { return m_pSegment->Finish(); } );
  m_pSegment.reset();
  const std::unique_ptr<VMkvIOCallback> pFile = std::move( m_pFile );
  return pFile->Stream().Close() && bFinished;
}

}
