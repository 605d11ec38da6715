#include "tests/support/RiffParser.h"

#include <algorithm>
#include <stdexcept>

namespace TestSupport
{

namespace
{

bool IsNamed( const VRiffChunk& i_rChunk, const std::string& i_rIdOrForm )
{
  return i_rChunk.m_Form.empty() ? i_rChunk.m_Id == i_rIdOrForm : i_rChunk.m_Form == i_rIdOrForm;
}

}

size_t VRiffChunk::Count( const std::string& i_rIdOrForm ) const
{
  return static_cast<size_t>(
    std::count_if( m_Children.begin(), m_Children.end(), [&]( const VRiffChunk& i_rChild ) { return IsNamed( i_rChild, i_rIdOrForm ); } ) );
}

const VRiffChunk& VRiffChunk::Child( const std::string& i_rIdOrForm ) const
{
  Require( Count( i_rIdOrForm ) == 1, "not one " + i_rIdOrForm, m_Position );
  return *std::find_if( m_Children.begin(), m_Children.end(), [&]( const VRiffChunk& i_rChild ) { return IsNamed( i_rChild, i_rIdOrForm ); } );
}

VRiffParser::VBytes VRiffParser::ReadFile( const std::string& i_rPath )
{
  const VFileBytes File = VFileBytes::OfFile( i_rPath );
  return File.Read( 0, File.Size() );
}

VRiffParser::VRiffParser( const VBytes& i_rBytes ) : m_Bytes( VFileBytes::OfBytes( i_rBytes ) ), m_Riffs( ParseChunks( 0, m_Bytes.Size() ) )
{
  for( const VRiffChunk& rRiff : m_Riffs )
  {
    Require( rRiff.m_Id == "RIFF", "no RIFF but " + rRiff.m_Id, rRiff.m_Position );
  }
}

std::vector<VRiffChunk> VRiffParser::ParseChunks( uint64_t i_Position, uint64_t i_End ) const
{
  std::vector<VRiffChunk> Chunks;
  while( i_Position < i_End )
  {
    VRiffChunk Chunk;
    Chunk.m_Position = i_Position;
    Chunk.m_Id = FourCC( i_Position );
    Chunk.m_Size = U32( i_Position + 4 );
    Chunk.m_Data = i_Position + 8;
    const uint64_t End = Chunk.m_Data + Chunk.m_Size;
    Require( End + Chunk.m_Size % 2 <= i_End, Chunk.m_Id + " of " + std::to_string( Chunk.m_Size ) + " bytes runs past its parent", i_Position );
    Require( Chunk.m_Size % 2 == 0 || m_Bytes.Big( End, 1 ) == 0, "padding that is not zero", End );
    if( Chunk.m_Id == "RIFF" || Chunk.m_Id == "LIST" )
    {
      Chunk.m_Form = FourCC( Chunk.m_Data );
      Chunk.m_Data += 4;
      Chunk.m_Size -= 4;
      // What the system keeps of its own is no list of chunks.
      Chunk.m_Children = Chunk.m_Form == "TMSL" ? std::vector<VRiffChunk>() : ParseChunks( Chunk.m_Data, End );
    }
    i_Position = End + ( End - Chunk.m_Position ) % 2;
    Chunks.push_back( std::move( Chunk ) );
  }
  return Chunks;
}

VAviParser::VAviParser( std::vector<uint8_t> i_Bytes ) : m_Riff( std::move( i_Bytes ) )
{
  Require( !m_Riff.Riffs().empty() && m_Riff.Riffs().front().m_Form == "AVI ", "no AVI", 0 );
  const size_t Streams = Headers().Count( "strl" );
  Require( m_Riff.U32( Headers().Child( "avih" ).m_Data + 24 ) == Streams, "another number of streams", Headers().m_Position );
  m_Chunks.resize( Streams );
  m_Indexed.resize( Streams );
  Walk();
  for( size_t Stream = 0; Stream < Streams; ++Stream )
  {
    CheckSuperIndex( Stream );
  }
  CheckOldIndex();
}

const VRiffChunk& VAviParser::Stream( size_t i_Number ) const
{
  for( const VRiffChunk& rChild : Headers().m_Children )
  {
    if( rChild.m_Form == "strl" && i_Number-- == 0 )
    {
      return rChild;
    }
  }
  throw std::runtime_error( "riff: no such stream" );
}

uint32_t VAviParser::TotalFrames() const
{
  const uint32_t Total = m_Riff.U32( Headers().Child( "avih" ).m_Data + 16 );
  Require( Total == m_Riff.U32( Headers().Child( "odml" ).Child( "dmlh" ).m_Data ), "two numbers of frames", Headers().m_Position );
  return Total;
}

uint32_t VAviParser::StreamLength( size_t i_Number ) const { return m_Riff.U32( Stream( i_Number ).Child( "strh" ).m_Data + 32 ); }

uint32_t VAviParser::SuperIndexEntries( size_t i_Number ) const { return m_Riff.U32( Stream( i_Number ).Child( "indx" ).m_Data + 4 ); }

void VAviParser::Walk()
{
  for( const VRiffChunk& rRiff : m_Riff.Riffs() )
  {
    const bool bFirst = &rRiff == &m_Riff.Riffs().front();
    if( rRiff.m_Form == "TMSL" || ( bFirst && rRiff.Count( "movi" ) == 0 ) )
    {
      continue;
    }
    Require( bFirst || rRiff.m_Form == "AVIX", "an unknown RIFF", rRiff.m_Position );
    for( const VRiffChunk& rChunk : rRiff.Child( "movi" ).m_Children )
    {
      if( rChunk.m_Id.substr( 0, 2 ) != "ix" )
      {
        m_Chunks.at( static_cast<size_t>( std::stoi( rChunk.m_Id.substr( 0, 2 ) ) ) ).push_back( rChunk );
        if( bFirst )
        {
          m_InFirstRiff.push_back( rChunk );
        }
      }
    }
  }
}

void VAviParser::CheckSuperIndex( size_t i_Stream )
{
  const VRiffChunk& rIndex = Stream( i_Stream ).Child( "indx" );
  Require( m_Riff.U16( rIndex.m_Data ) == 4 && m_Riff.U16( rIndex.m_Data + 2 ) == 0, "no super index", rIndex.m_Position );
  const uint32_t InUse = SuperIndexEntries( i_Stream );
  for( uint32_t Entry = 0; Entry < ( rIndex.m_Size - 24 ) / 16; ++Entry )
  {
    const uint64_t Position = rIndex.m_Data + 24 + uint64_t{ Entry } * 16;
    if( Entry < InUse )
    {
      CheckStandardIndex( i_Stream, m_Riff.U64( Position ), m_Riff.U32( Position + 8 ), m_Riff.U32( Position + 12 ) );
    }
    else
    {
      Require( m_Riff.U64( Position ) == 0 && m_Riff.U64( Position + 8 ) == 0, "an entry that is not in use", Position );
    }
  }
}

void VAviParser::CheckStandardIndex( size_t i_Stream, uint64_t i_Position, uint32_t i_Size, uint32_t i_Duration )
{
  Require( m_Riff.FourCC( i_Position ) == "ix0" + std::to_string( i_Stream ), "no standard index", i_Position );
  Require( m_Riff.U32( i_Position + 4 ) + 8 == i_Size && i_Size == 32 + i_Duration * 8, "another size", i_Position );
  const uint64_t Header = i_Position + 8;
  Require( m_Riff.U16( Header ) == 2 && m_Riff.U16( Header + 2 ) == 0x100 && m_Riff.U32( Header + 4 ) == i_Duration, "wrong header", Header );
  const uint64_t Base = m_Riff.U64( Header + 12 );
  for( uint32_t Entry = 0; Entry < i_Duration; ++Entry )
  {
    const VRiffChunk& rChunk = m_Chunks.at( i_Stream ).at( m_Indexed[i_Stream]++ );
    const uint64_t Position = Header + 24 + uint64_t{ Entry } * 8;
    Require( m_Riff.FourCC( Header + 8 ) == rChunk.m_Id, "another id", Header );
    Require( Base + m_Riff.U32( Position ) == rChunk.m_Data && m_Riff.U32( Position + 4 ) == rChunk.m_Size, "another place", Position );
  }
}

void VAviParser::CheckOldIndex() const
{
  const VRiffChunk& rRiff = m_Riff.Riffs().front();
  if( rRiff.Count( "movi" ) == 0 )
  {
    return;
  }
  const uint64_t Base = rRiff.Child( "movi" ).m_Data - 4;   // the four characters
  const VRiffChunk& rIndex = rRiff.Child( "idx1" );
  Require( rIndex.m_Size == m_InFirstRiff.size() * 16, "another number of entries", rIndex.m_Position );
  for( size_t Entry = 0; Entry < m_InFirstRiff.size(); ++Entry )
  {
    const VRiffChunk& rChunk = m_InFirstRiff[Entry];
    const uint64_t Position = rIndex.m_Data + Entry * 16;
    Require( m_Riff.FourCC( Position ) == rChunk.m_Id && m_Riff.U32( Position + 4 ) == 0x10, "another id", Position );
    Require( Base + m_Riff.U32( Position + 8 ) == rChunk.m_Position && m_Riff.U32( Position + 12 ) == rChunk.m_Size, "another place", Position );
  }
}

}
