#include "FileIO/TarvoVideo/Writer.h"

#include "CoreVideoUtils/FrameSize.h"
#include "FileIO/TarvoVideo/Format.h"
#include "FileIO/WriterSupport/AttributeBlock.h"
#include "FileIO/WriterSupport/AttributeMaps.h"
#include "FileIO/WriterSupport/BufferSpans.h"

#include <limits>

namespace TarvoVideo
{

VWriter::VWriter( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder, WriterSupport::VStreamMaker i_StreamMaker )
  : VWriterBase( "TarvoVideo" ), m_StreamMaker( std::move( i_StreamMaker ) ), m_Essence( std::move( i_pEncoder ) )
{
}

bool VWriter::DoOpen( const std::string& i_rPath )
{
  std::unique_ptr<UtilsIO::IClosableStream> pStream = m_StreamMaker( i_rPath );
  if( !pStream )
  {
    KVZ_LOG_ERROR( Category(), "File could not be opened." );
    return false;
  }
  m_pStream = std::make_unique<WriterSupport::VWatchedStream>( std::move( pStream ) );
  m_Index.clear();
  m_IncompleteFrames = 0;
  return true;
}

bool VWriter::DoWriteHeader( const WriterSupport::VHeader& i_rHeader )
{
  m_Essence.Store( i_rHeader );
  // A failure here shows in the block that follows, since the stream refuses it then.
  const VFixedHeader Header;
  m_pStream->Write( &Header, sizeof( Header ) );
  return WriteInternalBlock() && WriteExternalBlock( i_rHeader );
}

bool VWriter::WriteInternalBlock()
{
  KVZ::IVideoAttributes Attributes;
  if( !WriterSupport::EncodeInternalAttributes( m_Essence.Video(), m_Essence.Audio(), Attributes ) )
  {
    KVZ_LOG_ERROR( Category(), "Could not encode internal attributes." );
    return false;
  }
  if( !WriterSupport::WriteAttributeBlock( *m_pStream, Attributes ) )
  {
    KVZ_LOG_ERROR( Category(), "Could not write internal attributes." );
    return false;
  }
  return true;
}

bool VWriter::WriteExternalBlock( const WriterSupport::VHeader& i_rHeader )
{
  KVZ::IVideoAttributes Attributes;
  const WriterSupport::VRecordingDescription Recording{ i_rHeader.m_rAttributes, i_rHeader.m_rTiming, i_rHeader.m_rColour, i_rHeader.m_rTimecode,
    WriterSupport::ETimingKeys::WhenNotDefault, WriterSupport::ETimecodeKeys::WhenValid };
  if( !WriterSupport::EncodeExternalAttributes( Recording, Attributes ) )
  {
    KVZ_LOG_ERROR( Category(), "Could not encode external attributes." );
    return false;
  }
  if( !WriterSupport::WriteAttributeBlock( *m_pStream, Attributes ) )
  {
    KVZ_LOG_ERROR( Category(), "Could not write external attributes." );
    return false;
  }
  return true;
}

bool VWriter::DoWriteFrame( WriterSupport::VFrame& io_rFrame )
{
  if( m_pStream->HasFailed() || !m_Essence.Encode( io_rFrame, Category() ) )
  {
    return false;
  }
  const bool bAudio = m_Essence.Audio().HasAudio();
  const uint64_t AudioSum = bAudio ? KVZ::GetTotalSize( io_rFrame.m_rAudio ) : 0;
  if( !FitsDescription( io_rFrame, AudioSum ) )
  {
    return false;
  }
  const auto AudioBytes = static_cast<uint32_t>( AudioSum );
  CollectSpans( io_rFrame, bAudio ? &AudioBytes : nullptr );
  const auto [Entry, bNew] = m_Index.try_emplace( io_rFrame.m_Key, VRecord{ m_pStream->GetEnd(), AudioBytes } );
  if( Entry->second.m_AudioBytes != AudioBytes )
  {
    KVZ_LOG_ERROR( Category(), "Frame %1% has %2% bytes of audio in the file and cannot be replaced by one with %3%.", io_rFrame.m_Key,
      Entry->second.m_AudioBytes, AudioBytes );
    return false;
  }
  const bool bVideoWritten = m_pStream->Seek( Entry->second.m_Position ) && m_pStream->Write( m_VideoSpans );
  // Sound that could not be written shows in the next call.
  if( !bVideoWritten || !m_pStream->Write( m_AudioSpans ) )
  {
    m_Index.erase( Entry );
    m_IncompleteFrames += bVideoWritten ? 1 : 0;
  }
  return bVideoWritten;
}

// A record carries no length of its own: one that does not match the header's description would make every reader see a wrong picture.
bool VWriter::FitsDescription( const WriterSupport::VFrame& i_rFrame, uint64_t i_AudioBytes ) const
{
  const uint64_t VideoBytes = KVZ::GetTotalSize( i_rFrame.m_rVideo );
  const KVZ::VideoFrameInfo& rStored = m_Essence.Video();
  const uint64_t StoredBytes = CoreVideoUtils::GetFrameSize( rStored );
  const KVZ::VideoFrameInfo& rInfo = i_rFrame.m_rVideoInfo;
  if( VideoBytes != StoredBytes || rInfo.m_ImageWidth != rStored.m_ImageWidth || rInfo.m_ImageHeight != rStored.m_ImageHeight )
  {
    KVZ_LOG_ERROR( Category(), "Frame %1% of %2% x %3% pixels and %4% bytes does not fit the file's %5% x %6% pixels and %7% bytes.", i_rFrame.m_Key,
      rInfo.m_ImageWidth, rInfo.m_ImageHeight, VideoBytes, rStored.m_ImageWidth, rStored.m_ImageHeight, StoredBytes );
    return false;
  }
  if( i_AudioBytes > std::numeric_limits<uint32_t>::max() )
  {
    KVZ_LOG_ERROR( Category(), "Frame %1% has %2% bytes of audio, more than the 4294967295 that a record can hold.", i_rFrame.m_Key, i_AudioBytes );
    return false;
  }
  return true;
}

// Needs memory, so it comes before the index: an entry must not stay where its record was never begun. Without a length there is no sound.
void VWriter::CollectSpans( const WriterSupport::VFrame& i_rFrame, const uint32_t* i_pAudioLength )
{
  m_VideoSpans.clear();
  WriterSupport::AppendSpans( m_VideoSpans, i_rFrame.m_rVideo );
  m_AudioSpans.clear();
  if( i_pAudioLength )
  {
    m_AudioSpans.emplace_back( i_pAudioLength, sizeof( *i_pAudioLength ) );
    WriterSupport::AppendSpans( m_AudioSpans, i_rFrame.m_rAudio );
  }
}

bool VWriter::DoClose()
{
  const std::unique_ptr<WriterSupport::VWatchedStream> pStream = std::move( m_pStream );
  const bool bIndexed = IsHeaded() && WriteIndex( *pStream );
  return pStream->Close() && bIndexed;
}

bool VWriter::WriteIndex( WriterSupport::VWatchedStream& io_rStream ) const
{
  constexpr size_t EntriesAtOnce = 4096;
  const uint64_t Position = io_rStream.GetEnd();
  const uint64_t Count = m_Index.size();
  bool bGood = io_rStream.Seek( Position ) && io_rStream.Write( &Count, sizeof( Count ) );
  std::vector<VIndexEntry> Entries;
  Entries.reserve( EntriesAtOnce );
  for( auto Entry = m_Index.begin(); bGood && Entry != m_Index.end(); )
  {
    Entries.push_back( { Entry->first, Entry->second.m_Position } );
    if( ++Entry == m_Index.end() || Entries.size() == EntriesAtOnce )
    {
      bGood = io_rStream.Write( Entries.data(), Entries.size() * sizeof( VIndexEntry ) );
      Entries.clear();
    }
  }
  if( !bGood )
  {
    KVZ_LOG_ERROR( Category(), "Could not write index entries." );
    return false;
  }
  return io_rStream.Seek( IndexPositionOffset ) && io_rStream.Write( &Position, sizeof( Position ) );
}

}
