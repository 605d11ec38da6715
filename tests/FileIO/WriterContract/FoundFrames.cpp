#include "tests/FileIO/WriterContract/FoundFrames.h"

#include "tests/support/ByteBuilder.h"
#include "tests/support/EbmlParser.h"
#include "tests/support/MovParser.h"
#include "tests/support/RiffParser.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <stdexcept>

namespace WriterContract
{

using namespace TestSupport;

namespace
{

void AddPicture( VFound& io_rFile, const VBytes& i_rPicture ) { io_rFile.m_Frames[io_rFile.m_Frames.size()].m_Video = i_rPicture; }

void AddSound( VFound& io_rFile, const VBytes& i_rSound )
{
  if( !io_rFile.m_Frames.empty() )
  {
    io_rFile.m_Frames.rbegin()->second.m_Audio = i_rSound;
  }
}

bool IsWholeAvi( const VBytes& i_rBytes )
try
{
  const VAviParser Parser( i_rBytes );
  return Parser.Chunks( 0 ).size() == Parser.TotalFrames() && Parser.CountIndexed( 0 ) == Parser.TotalFrames();
}
catch( const std::runtime_error& )
{
  return false;
}

bool IsWholeMkv( const VEbmlParser& i_rFile, size_t i_Size )
{
  const VEbmlElement& rSegment = i_rFile.Find( { Ebml::Segment } );
  const auto IsAt = [&]( uint64_t i_Position, uint32_t i_Id )
  {
    return std::any_of( rSegment.m_Children.begin(), rSegment.m_Children.end(),
      [&]( const VEbmlElement& i_rElement ) { return i_rElement.m_Position == i_Position && i_rElement.m_Id == i_Id; } );
  };
  for( const VMatroskaSeek& rSeek : ReadSeeks( i_rFile ) )
  {
    EXPECT_TRUE( IsAt( rSeek.m_Position, rSeek.m_Id ) );
  }
  const auto Cues = ReadCues( i_rFile );
  for( const VMatroskaCue& rCue : Cues )
  {
    EXPECT_TRUE( IsAt( rCue.m_Cluster, Ebml::Cluster ) );
  }
  return !rSegment.m_bUnknownSize && rSegment.End() == i_Size && Cues.size() == ReadBlocks( i_rFile ).size();
}

}

std::optional<VFound> ReadTvid( const VBytes& i_rBytes )
{
  const VFound File = TarvoVideo::ReadAll( i_rBytes );
  return File.m_Error.empty() ? std::optional( File ) : std::nullopt;
}

// What comes behind the tables, and may be cut off, is no hindrance.
std::optional<VFound> ReadMov( const VBytes& i_rBytes )
try
{
  VBytes Whole = i_rBytes;
  const VBytes Type = Bytes( "moov" );
  const auto Moov = std::search( Whole.begin(), Whole.end(), Type.begin(), Type.end() );
  if( Moov != Whole.end() )
  {
    const size_t Size = Moov[-2] * 256u + Moov[-1];
    Whole.resize( std::min( Whole.size(), static_cast<size_t>( Moov - Whole.begin() ) - 4 + Size ) );
  }
  const auto Parser = VMovParser::OfBytes( Whole );
  VFound File;
  File.m_bFinished = true;
  for( size_t Frame = 0; Frame < Parser.Track( "vide" ).m_Samples.size(); ++Frame )
  {
    AddPicture( File, Parser.Bytes( Parser.Track( "vide" ).m_Samples[Frame] ) );
    AddSound( File, Parser.Bytes( Parser.Track( "soun" ).m_Samples.at( Frame ) ) );
  }
  return File;
}
catch( const std::runtime_error& )
{
  return {};
}

// In the indexes other numbers follow the ids.
std::optional<VFound> ReadAvi( const VBytes& i_rBytes )
{
  const VBytes PictureHead = VLittleEndian().Raw( "00db" ).U32( PictureBytes ).m_Bytes;
  const VBytes SoundHead = VLittleEndian().Raw( "01wb" ).U32( SoundBytes ).m_Bytes;
  VFound File;
  File.m_bFinished = IsWholeAvi( i_rBytes );
  for( auto Chunk = i_rBytes.begin(); i_rBytes.end() - Chunk >= static_cast<std::ptrdiff_t>( PictureHead.size() + SoundBytes ); ++Chunk )
  {
    const auto Content = Chunk + static_cast<std::ptrdiff_t>( PictureHead.size() );
    const bool bWholePicture = i_rBytes.end() - Content >= static_cast<std::ptrdiff_t>( PictureBytes );
    if( std::equal( PictureHead.begin(), PictureHead.end(), Chunk ) && bWholePicture )
    {
      AddPicture( File, VBytes( Content, Content + PictureBytes ) );
    }
    if( std::equal( SoundHead.begin(), SoundHead.end(), Chunk ) )
    {
      AddSound( File, VBytes( Content, Content + SoundBytes ) );
    }
  }
  return File;
}

std::optional<VFound> ReadMkv( const VBytes& i_rBytes )
try
{
  const VEbmlParser Parser( i_rBytes );
  VFound File;
  File.m_bFinished = IsWholeMkv( Parser, i_rBytes.size() );
  for( const VMatroskaBlock& rBlock : ReadBlocks( Parser ) )
  {
    rBlock.m_Track == 1 ? AddPicture( File, rBlock.m_Data ) : AddSound( File, rBlock.m_Data );
  }
  return File;
}
catch( const std::runtime_error& )
{
  return {};
}

}
