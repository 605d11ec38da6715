#include "tests/support/EbmlParser.h"

#include <algorithm>
#include <bit>

namespace TestSupport
{

namespace
{

bool IsMaster( uint32_t i_Id )
{
  using namespace Ebml;
  static const std::vector<uint32_t> s_Masters = { Head, Segment, SeekHead, Seek, Info, Tracks, TrackEntry, Video, Audio, Tags, Tag, Targets,
    SimpleTag, Cluster, BlockGroup, Cues, CuePoint, CueTrackPositions };
  return std::find( s_Masters.begin(), s_Masters.end(), i_Id ) != s_Masters.end();
}

}

std::vector<const VEbmlElement*> VEbmlElement::FindAll( const VPath& i_rPath ) const
{
  std::vector<const VEbmlElement*> Found = { this };
  for( const uint32_t Id : i_rPath )
  {
    std::vector<const VEbmlElement*> Below;
    for( const VEbmlElement* pElement : Found )
    {
      for( const VEbmlElement& rChild : pElement->m_Children )
      {
        if( rChild.m_Id == Id )
        {
          Below.push_back( &rChild );
        }
      }
    }
    Found = std::move( Below );
  }
  return Found;
}

const VEbmlElement& VEbmlElement::Find( const VPath& i_rPath ) const
{
  const auto Found = FindAll( i_rPath );
  Require( !Found.empty(), "there is no element " + std::to_string( i_rPath.back() ), m_Position );
  return *Found.front();
}

VEbmlParser::VEbmlParser( const VBytes& i_rBytes ) : m_Bytes( VFileBytes::OfBytes( i_rBytes ) )
{
  m_File.m_Children = Parse( 0, m_Bytes.Size(), false );
}

std::vector<VEbmlElement> VEbmlParser::Parse( uint64_t i_Begin, uint64_t i_End, bool i_bMayBeCut ) const
{
  std::vector<VEbmlElement> Elements;
  uint64_t Position = i_Begin;
  while( Position < i_End )
  {
    VEbmlElement Element;
    Element.m_Position = Position;
    if( !ParseHead( i_End, Element ) )
    {
      Require( i_bMayBeCut, "an element runs past the end at " + std::to_string( i_End ), Position );
      break;
    }
    if( IsMaster( Element.m_Id ) )
    {
      Element.m_Children = Parse( Element.m_Data, Element.End(), Element.m_bUnknownSize );
    }
    if( Element.m_bUnknownSize )
    {
      Element.m_Size = Element.m_Children.empty() ? 0 : Element.m_Children.back().End() - Element.m_Data;
      i_End = Element.End();
    }
    Position = Element.End();
    Elements.push_back( std::move( Element ) );
  }
  return Elements;
}

uint64_t VEbmlParser::CodedBytes( uint64_t i_Position ) const
{
  return static_cast<uint64_t>( std::countl_zero( static_cast<uint8_t>( m_Bytes.Big( i_Position, 1 ) ) ) ) + 1;
}

// False where it is not whole.
bool VEbmlParser::ParseHead( uint64_t i_End, VEbmlElement& io_rElement ) const
{
  const uint64_t IdBytes = CodedBytes( io_rElement.m_Position );
  const uint64_t SizeAt = io_rElement.m_Position + IdBytes;
  if( IdBytes > 4 || SizeAt >= i_End )
  {
    return false;
  }
  const uint64_t SizeBytes = CodedBytes( SizeAt );
  if( SizeBytes > 8 || SizeAt + SizeBytes > i_End )
  {
    return false;
  }
  const uint64_t Mask = ( uint64_t{ 1 } << ( 7 * SizeBytes ) ) - 1;
  io_rElement.m_Id = static_cast<uint32_t>( m_Bytes.Big( io_rElement.m_Position, IdBytes ) );
  io_rElement.m_SizeBytes = static_cast<int>( SizeBytes );
  io_rElement.m_Data = SizeAt + SizeBytes;
  io_rElement.m_Size = m_Bytes.Big( SizeAt, SizeBytes ) & Mask;
  io_rElement.m_bUnknownSize = io_rElement.m_Size == Mask;
  if( io_rElement.m_bUnknownSize )
  {
    io_rElement.m_Size = i_End - io_rElement.m_Data;
  }
  return io_rElement.m_Size <= i_End - io_rElement.m_Data;
}

double VEbmlParser::Real( const VPath& i_rPath ) const
{
  const VEbmlElement& rElement = Find( i_rPath );
  const uint64_t Bits = NumberOf( rElement );
  return rElement.m_Size == 4 ? std::bit_cast<float>( static_cast<uint32_t>( Bits ) ) : std::bit_cast<double>( Bits );
}

std::vector<VMatroskaBlock> ReadBlocks( const VEbmlParser& i_rFile )
{
  std::vector<VMatroskaBlock> Blocks;
  for( const VEbmlElement* pCluster : i_rFile.FindAll( { Ebml::Segment, Ebml::Cluster } ) )
  {
    const uint64_t Time = i_rFile.NumberOf( pCluster->Find( { Ebml::Timestamp } ) );
    for( const VEbmlElement* pGroup : pCluster->FindAll( { Ebml::BlockGroup } ) )
    {
      const auto Data = i_rFile.BytesOf( pGroup->Find( { Ebml::Block } ) );
      const auto Offset = static_cast<int16_t>( Data.at( 1 ) << 8 | Data.at( 2 ) );
      Require( ( Data[0] & 0x80 ) != 0 && Data.at( 3 ) == 0, "a block with a long track number, or with flags", pGroup->m_Position );
      VMatroskaBlock Block;
      Block.m_Cluster = pCluster->m_Position;
      Block.m_Track = Data[0] & 0x7F;
      Block.m_Time = Time + static_cast<uint64_t>( int64_t{ Offset } );
      Block.m_Duration = i_rFile.NumberOf( pGroup->Find( { Ebml::BlockDuration } ) );
      Block.m_Data.assign( Data.begin() + 4, Data.end() );
      Blocks.push_back( std::move( Block ) );
    }
  }
  return Blocks;
}

std::vector<VMatroskaCue> ReadCues( const VEbmlParser& i_rFile )
{
  const uint64_t Start = i_rFile.Find( { Ebml::Segment } ).m_Data;
  std::vector<VMatroskaCue> Cues;
  for( const VEbmlElement* pPoint : i_rFile.FindAll( { Ebml::Segment, Ebml::Cues, Ebml::CuePoint } ) )
  {
    const VEbmlElement& rPositions = pPoint->Find( { Ebml::CueTrackPositions } );
    Cues.push_back( { i_rFile.NumberOf( pPoint->Find( { Ebml::CueTime } ) ), i_rFile.NumberOf( rPositions.Find( { Ebml::CueTrack } ) ),
      Start + i_rFile.NumberOf( rPositions.Find( { Ebml::CueClusterPosition } ) ) } );
  }
  return Cues;
}

std::vector<VMatroskaSeek> ReadSeeks( const VEbmlParser& i_rFile )
{
  const uint64_t Start = i_rFile.Find( { Ebml::Segment } ).m_Data;
  std::vector<VMatroskaSeek> Seeks;
  for( const VEbmlElement* pSeek : i_rFile.FindAll( { Ebml::Segment, Ebml::SeekHead, Ebml::Seek } ) )
  {
    const auto Id = static_cast<uint32_t>( i_rFile.NumberOf( pSeek->Find( { Ebml::SeekID } ) ) );
    Seeks.push_back( { Id, Start + i_rFile.NumberOf( pSeek->Find( { Ebml::SeekPosition } ) ) } );
  }
  return Seeks;
}

std::map<std::string, std::string> ReadTags( const VEbmlParser& i_rFile )
{
  std::map<std::string, std::string> Tags;
  for( const VEbmlElement* pTag : i_rFile.FindAll( { Ebml::Segment, Ebml::Tags, Ebml::Tag, Ebml::SimpleTag } ) )
  {
    Tags[i_rFile.TextOf( pTag->Find( { Ebml::TagName } ) )] = i_rFile.TextOf( pTag->Find( { Ebml::TagString } ) );
  }
  return Tags;
}

}
