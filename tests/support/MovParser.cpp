#include "tests/support/MovParser.h"

#include <algorithm>
#include <set>
#include <stdexcept>

namespace TestSupport
{

namespace
{

// "tmcd" and "hdlr" are none: in a media header the one holds another atom, as a sample format it does not.
const std::set<std::string> Containers = { "moov", "trak", "tapt", "edts", "tref", "mdia", "minf", "dinf", "gmhd", "stbl" };

}

std::string VMovAtom::Tree() const
{
  std::string Text;
  for( const VMovAtom& rChild : m_Children )
  {
    Text += ( Text.empty() ? "" : " " ) + rChild.m_Type + ( rChild.m_Children.empty() ? "" : "(" + rChild.Tree() + ")" );
  }
  return Text;
}

const VMovAtom& VMovAtom::Child( const std::string& i_rType, size_t i_Number ) const
{
  for( const VMovAtom& rChild : m_Children )
  {
    if( rChild.m_Type == i_rType && i_Number-- == 0 )
    {
      return rChild;
    }
  }
  throw std::runtime_error( "mov: no '" + i_rType + "' in '" + m_Type + "'" );
}

bool VMovAtom::Has( const std::string& i_rType ) const
{
  return std::any_of( m_Children.begin(), m_Children.end(), [&]( const VMovAtom& i_rChild ) { return i_rChild.m_Type == i_rType; } );
}

VMovParser::VMovParser( VFileBytes i_Bytes ) : m_Bytes( std::move( i_Bytes ) )
{
  m_Root.m_Type = "file";
  m_Root.m_End = m_Bytes.Size();
  ReadAtoms( m_Root, 0 );
  for( const VMovAtom& rAtom : m_Root.Child( "moov" ).m_Children )
  {
    if( rAtom.m_Type == "trak" )
    {
      m_Tracks.push_back( ReadTrack( rAtom ) );
    }
  }
}

void VMovParser::ReadAtoms( VMovAtom& io_rParent, uint64_t i_Position ) const
{
  while( i_Position != io_rParent.m_End )
  {
    Require( i_Position + 8 <= io_rParent.m_End, "no room for an atom in '" + io_rParent.m_Type + "'", i_Position );
    VMovAtom Atom{ m_Bytes.Text( i_Position + 4, 4 ), i_Position, i_Position + 8, 0, {} };
    uint64_t Size = m_Bytes.Big( i_Position, 4 );
    if( Size == 1 )
    {
      Size = m_Bytes.Big( i_Position + 8, 8 );
      Atom.m_Body += 8;
    }
    Atom.m_End = i_Position + Size;
    Require( Atom.m_End >= Atom.m_Body && Atom.m_End <= io_rParent.m_End, "wrong size of '" + Atom.m_Type + "'", i_Position );
    const bool bTimecodeHeader = Atom.m_Type == "tmcd" && io_rParent.m_Type == "gmhd";
    if( Containers.count( Atom.m_Type ) != 0 || bTimecodeHeader )
    {
      ReadAtoms( Atom, Atom.m_Body );
    }
    i_Position = Atom.m_End;
    io_rParent.m_Children.push_back( std::move( Atom ) );
  }
}

uint64_t VMovParser::Number( const VMovAtom& i_rAtom, uint64_t i_Offset, size_t i_Bytes ) const
{
  Require( i_rAtom.m_Body + i_Offset + i_Bytes <= i_rAtom.m_End, "'" + i_rAtom.m_Type + "' is too short", i_rAtom.m_Position );
  return m_Bytes.Big( i_rAtom.m_Body + i_Offset, i_Bytes );
}

const VMovTrack& VMovParser::Track( const std::string& i_rHandler ) const
{
  const auto Found = std::find_if( m_Tracks.begin(), m_Tracks.end(), [&]( const VMovTrack& i_rTrack ) { return i_rTrack.m_Handler == i_rHandler; } );
  Require( Found != m_Tracks.end(), "no track of " + i_rHandler, 0 );
  return *Found;
}

VMovTrack VMovParser::ReadTrack( const VMovAtom& i_rTrak ) const
{
  const VMovAtom& rMdia = i_rTrak.Child( "mdia" );
  const VMovAtom& rElst = i_rTrak.Child( "edts" ).Child( "elst" );
  Require( CountEntries( rElst, 4, 12 ) == 1, "more than one edit", rElst.m_Position );
  VMovTrack Track;
  Track.m_Handler = m_Bytes.Text( rMdia.Child( "hdlr" ).m_Body + 8, 4 );
  Track.m_Timescale = U32( rMdia.Child( "mdhd" ), 12 );
  Track.m_MediaDuration = U32( rMdia.Child( "mdhd" ), 16 );
  Track.m_EditDuration = U32( rElst, 8 );
  Track.m_EditStart = U32( rElst, 12 );
  ReadSamples( rMdia.Child( "minf" ).Child( "stbl" ), Track );
  return Track;
}

uint32_t VMovParser::CountEntries( const VMovAtom& i_rAtom, uint64_t i_Header, size_t i_Width ) const
{
  const uint32_t Count = U32( i_rAtom, i_Header );
  Require( i_rAtom.m_Body + i_Header + 4 + uint64_t{ Count } * i_Width == i_rAtom.m_End, "'" + i_rAtom.m_Type + "' is not what its count says",
    i_rAtom.m_Position );
  return Count;
}

void VMovParser::ReadSamples( const VMovAtom& i_rStbl, VMovTrack& o_rTrack ) const
{
  const VMovAtom& rStts = i_rStbl.Child( "stts" );
  Require( CountEntries( rStts, 4, 8 ) == 1, "more than one duration", rStts.m_Position );
  const uint32_t Count = U32( rStts, 8 );
  const uint64_t Delta = Number( rStts, 12 );
  const VMovAtom& rCo64 = i_rStbl.Child( "co64" );
  const std::vector<uint32_t> PerChunk = ReadChunkCounts( i_rStbl.Child( "stsc" ), CountEntries( rCo64, 4, 8 ) );
  const std::vector<uint32_t> Sizes = ReadSizes( i_rStbl.Child( "stsz" ), Count );
  const std::vector<uint32_t> Composition = ReadOffsets( i_rStbl, Count );
  uint32_t Sample = 0;
  for( size_t Chunk = 0; Chunk < PerChunk.size(); ++Chunk )
  {
    const uint32_t Samples = PerChunk[Chunk];
    Require( uint64_t{ Sample } + Samples <= Count, "more samples in chunks than have a duration", rCo64.m_Position );
    VMovSample Found;
    Found.m_Position = Number( rCo64, 8 + 8 * Chunk, 8 );
    Found.m_Count = Samples;
    Found.m_Size = Sizes[Sample % Sizes.size()] * Samples;
    Found.m_DecodeTime = Sample * Delta;
    Found.m_ShownTime = Found.m_DecodeTime + Composition[Sample];
    o_rTrack.m_Samples.push_back( Found );
    Sample += Samples;
  }
  Require( Sample == Count, "fewer samples in chunks than have a duration", rCo64.m_Position );
  if( i_rStbl.Has( "stss" ) )
  {
    const VMovAtom& rStss = i_rStbl.Child( "stss" );
    for( VMovSample& rSample : o_rTrack.m_Samples )
    {
      rSample.m_bKeyFrame = false;
    }
    for( uint32_t Entry = 0; Entry < CountEntries( rStss, 4, 4 ); ++Entry )
    {
      o_rTrack.m_Samples.at( Number( rStss, 8 + 4 * Entry ) - 1 ).m_bKeyFrame = true;
    }
  }
}

// One for all, or one each.
std::vector<uint32_t> VMovParser::ReadSizes( const VMovAtom& i_rStsz, uint32_t i_Count ) const
{
  const uint32_t OneSize = U32( i_rStsz, 4 );
  if( OneSize != 0 || i_Count == 0 )
  {
    Require( i_rStsz.m_End - i_rStsz.m_Body == 12 && Number( i_rStsz, 8 ) == i_Count, "'stsz' has another count", i_rStsz.m_Position );
    return { OneSize };
  }
  Require( CountEntries( i_rStsz, 8, 4 ) == i_Count, "'stsz' has another count", i_rStsz.m_Position );
  std::vector<uint32_t> Sizes;
  for( uint32_t Sample = 0; Sample < i_Count; ++Sample )
  {
    Sizes.push_back( U32( i_rStsz, 12 + 4 * Sample ) );
  }
  return Sizes;
}

std::vector<uint32_t> VMovParser::ReadChunkCounts( const VMovAtom& i_rStsc, size_t i_Chunks ) const
{
  const uint32_t Entries = CountEntries( i_rStsc, 4, 12 );
  std::vector<uint32_t> Counts;
  for( uint32_t Entry = 0; Entry < Entries; ++Entry )
  {
    const uint64_t Offset = 8 + 12 * Entry;
    Require( U32( i_rStsc, Offset ) == Counts.size() + 1, "chunks out of order", i_rStsc.m_Position );
    Require( U32( i_rStsc, Offset + 8 ) == 1, "another sample description", i_rStsc.m_Position );
    const size_t End = Entry + 1 < Entries ? U32( i_rStsc, Offset + 12 ) - 1 : i_Chunks;
    Require( End <= i_Chunks, "more chunks than offsets", i_rStsc.m_Position );
    Counts.resize( std::max( Counts.size(), End ), U32( i_rStsc, Offset + 4 ) );
  }
  Require( Counts.size() == i_Chunks, "fewer chunks than offsets", i_rStsc.m_Position );
  return Counts;
}

std::vector<uint32_t> VMovParser::ReadOffsets( const VMovAtom& i_rStbl, uint32_t i_Count ) const
{
  if( !i_rStbl.Has( "ctts" ) )
  {
    return std::vector<uint32_t>( i_Count, 0 );
  }
  std::vector<uint32_t> Offsets;
  const VMovAtom& rCtts = i_rStbl.Child( "ctts" );
  for( uint32_t Entry = 0; Entry < CountEntries( rCtts, 4, 8 ); ++Entry )
  {
    Offsets.resize( Offsets.size() + Number( rCtts, 8 + 8 * Entry ), U32( rCtts, 12 + 8 * Entry ) );
  }
  Require( Offsets.size() == i_Count, "'ctts' has another count", rCtts.m_Position );
  return Offsets;
}

}
