#include "tests/support/EbmlParser.h"

#include <algorithm>
#include <bit>
#include <stdexcept>

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

VEbmlParser::VEbmlParser( VBytes i_Bytes ) : m_Bytes( std::move( i_Bytes ) ), m_Elements( Parse( 0, m_Bytes.size(), false ) ) {}

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
      if( i_bMayBeCut )
      {
        break;
      }
      throw std::runtime_error( "an element at " + std::to_string( Position ) + " runs past the end at " + std::to_string( i_End ) );
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

// False where it is not whole.
bool VEbmlParser::ParseHead( uint64_t i_End, VEbmlElement& io_rElement ) const
{
  const uint64_t IdBytes = static_cast<uint64_t>( std::countl_zero( m_Bytes[io_rElement.m_Position] ) ) + 1;
  const uint64_t SizeAt = io_rElement.m_Position + IdBytes;
  if( IdBytes > 4 || SizeAt >= i_End )
  {
    return false;
  }
  const uint64_t SizeBytes = static_cast<uint64_t>( std::countl_zero( m_Bytes[SizeAt] ) ) + 1;
  if( SizeBytes > 8 || SizeAt + SizeBytes > i_End )
  {
    return false;
  }
  const uint64_t Mask = ( uint64_t{ 1 } << ( 7 * SizeBytes ) ) - 1;
  io_rElement.m_Id = static_cast<uint32_t>( BigEndian( io_rElement.m_Position, IdBytes ) );
  io_rElement.m_SizeBytes = static_cast<int>( SizeBytes );
  io_rElement.m_Data = SizeAt + SizeBytes;
  io_rElement.m_Size = BigEndian( SizeAt, SizeBytes ) & Mask;
  io_rElement.m_bUnknownSize = io_rElement.m_Size == Mask;
  if( io_rElement.m_bUnknownSize )
  {
    io_rElement.m_Size = i_End - io_rElement.m_Data;
  }
  return io_rElement.m_Size <= i_End - io_rElement.m_Data;
}

uint64_t VEbmlParser::BigEndian( uint64_t i_Position, uint64_t i_Size ) const
{
  uint64_t Value = 0;
  for( uint64_t Byte = 0; Byte < i_Size; ++Byte )
  {
    Value = Value << 8 | m_Bytes[i_Position + Byte];
  }
  return Value;
}

std::vector<const VEbmlElement*> VEbmlParser::FindIn( const std::vector<VEbmlElement>& i_rElements, const VPath& i_rPath )
{
  std::vector<const VEbmlElement*> Found;
  for( const VEbmlElement& rElement : i_rElements )
  {
    if( rElement.m_Id != i_rPath.front() )
    {
      continue;
    }
    if( i_rPath.size() == 1 )
    {
      Found.push_back( &rElement );
      continue;
    }
    const auto Below = FindIn( rElement.m_Children, VPath( i_rPath.begin() + 1, i_rPath.end() ) );
    Found.insert( Found.end(), Below.begin(), Below.end() );
  }
  return Found;
}

const VEbmlElement& VEbmlParser::Find( const VPath& i_rPath ) const
{
  const auto Found = FindAll( i_rPath );
  if( Found.empty() )
  {
    throw std::runtime_error( "there is no element " + std::to_string( i_rPath.back() ) );
  }
  return *Found.front();
}

double VEbmlParser::Real( const VPath& i_rPath ) const
{
  const VEbmlElement& rElement = Find( i_rPath );
  const uint64_t Bits = NumberOf( rElement );
  return rElement.m_Size == 4 ? std::bit_cast<float>( static_cast<uint32_t>( Bits ) ) : std::bit_cast<double>( Bits );
}

uint64_t VEbmlParser::NumberOf( const VEbmlElement& i_rElement ) const { return BigEndian( i_rElement.m_Data, i_rElement.m_Size ); }

std::string VEbmlParser::TextOf( const VEbmlElement& i_rElement ) const
{
  const VBytes Data = BytesOf( i_rElement );
  return { Data.begin(), Data.end() };
}

VEbmlParser::VBytes VEbmlParser::BytesOf( const VEbmlElement& i_rElement ) const
{
  const auto Begin = m_Bytes.begin() + static_cast<std::ptrdiff_t>( i_rElement.m_Data );
  return { Begin, Begin + static_cast<std::ptrdiff_t>( i_rElement.m_Size ) };
}

std::vector<VMatroskaBlock> ReadBlocks( const VEbmlParser& i_rFile )
{
  std::vector<VMatroskaBlock> Blocks;
  for( const VEbmlElement* pCluster : i_rFile.FindAll( { Ebml::Segment, Ebml::Cluster } ) )
  {
    const uint64_t Time = i_rFile.NumberOf( *VEbmlParser::FindIn( pCluster->m_Children, { Ebml::Timestamp } ).at( 0 ) );
    for( const VEbmlElement* pGroup : VEbmlParser::FindIn( pCluster->m_Children, { Ebml::BlockGroup } ) )
    {
      const auto Data = i_rFile.BytesOf( *VEbmlParser::FindIn( pGroup->m_Children, { Ebml::Block } ).at( 0 ) );
      const auto Offset = static_cast<int16_t>( Data.at( 1 ) << 8 | Data.at( 2 ) );
      if( ( Data[0] & 0x80 ) == 0 || Data.at( 3 ) != 0 )
      {
        throw std::runtime_error( "a block with a long track number, or with flags" );
      }
      VMatroskaBlock Block;
      Block.m_Cluster = pCluster->m_Position;
      Block.m_Track = Data[0] & 0x7F;
      Block.m_Time = Time + static_cast<uint64_t>( int64_t{ Offset } );
      Block.m_Duration = i_rFile.NumberOf( *VEbmlParser::FindIn( pGroup->m_Children, { Ebml::BlockDuration } ).at( 0 ) );
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
    const auto Number = [&]( const VEbmlParser::VPath& i_rPath )
    { return i_rFile.NumberOf( *VEbmlParser::FindIn( pPoint->m_Children, i_rPath ).at( 0 ) ); };
    Cues.push_back( { Number( { Ebml::CueTime } ), Number( { Ebml::CueTrackPositions, Ebml::CueTrack } ),
      Start + Number( { Ebml::CueTrackPositions, Ebml::CueClusterPosition } ) } );
  }
  return Cues;
}

std::vector<VMatroskaSeek> ReadSeeks( const VEbmlParser& i_rFile )
{
  const uint64_t Start = i_rFile.Find( { Ebml::Segment } ).m_Data;
  std::vector<VMatroskaSeek> Seeks;
  for( const VEbmlElement* pSeek : i_rFile.FindAll( { Ebml::Segment, Ebml::SeekHead, Ebml::Seek } ) )
  {
    const auto Number = [&]( Ebml::EId i_Id ) { return i_rFile.NumberOf( *VEbmlParser::FindIn( pSeek->m_Children, { i_Id } ).at( 0 ) ); };
    Seeks.push_back( { static_cast<uint32_t>( Number( Ebml::SeekID ) ), Start + Number( Ebml::SeekPosition ) } );
  }
  return Seeks;
}

std::map<std::string, std::string> ReadTags( const VEbmlParser& i_rFile )
{
  std::map<std::string, std::string> Tags;
  for( const VEbmlElement* pTag : i_rFile.FindAll( { Ebml::Segment, Ebml::Tags, Ebml::Tag, Ebml::SimpleTag } ) )
  {
    const auto Text = [&]( Ebml::EId i_Id ) { return i_rFile.TextOf( *VEbmlParser::FindIn( pTag->m_Children, { i_Id } ).at( 0 ) ); };
    Tags[Text( Ebml::TagName )] = Text( Ebml::TagString );
  }
  return Tags;
}

}
