#include "FileIO/MkvIO/ElementSetting.h"
#include "FileIO/MkvIO/Tracks.h"
#include "tests/FileIO/MkvIO/SmallMovie.h"
#include "tests/support/ByteBuilder.h"
#include "tests/support/EbmlParser.h"
#include "tests/support/LogCapture.h"

#include <ebml/MemIOCallback.h>
#include <gtest/gtest.h>

#include <algorithm>

using namespace KVZ;
using namespace MkvIO;
using namespace TestSupport;

namespace
{

constexpr uint64_t Period = 33366;   // of 29.97 frames a second in the file's unit, a microsecond

class MkvWriter : public testing::Test
{
protected:
  VEbmlParser Parse() const { return VEbmlParser( *m_Movie.m_pBytes ); }

  void WriteFrames( uint64_t i_Count )
  {
    for( uint64_t Frame = 0; Frame < i_Count; ++Frame )
    {
      ASSERT_TRUE( m_Movie.WriteFrame( "ABCD", "abcd", Frame ) );
    }
  }

  const VLogCapture m_Log{ "MkvIO" };
  VSmallMovie m_Movie;
};

std::vector<uint32_t> Ids( const std::vector<VEbmlElement>& i_rElements )
{
  std::vector<uint32_t> Result;
  std::transform( i_rElements.begin(), i_rElements.end(), std::back_inserter( Result ), []( const auto& i_rElement ) { return i_rElement.m_Id; } );
  return Result;
}

uint32_t IdAt( const VEbmlParser& i_rFile, uint64_t i_Position )
{
  for( const VEbmlElement& rElement : i_rFile.Find( { Ebml::Segment } ).m_Children )
  {
    if( rElement.m_Position == i_Position ) return rElement.m_Id;
  }
  return 0;
}

}

TEST_F( MkvWriter, ASmallFileHoldsTheseElements )
{
  ASSERT_TRUE( m_Movie.Begin() );
  ASSERT_TRUE( m_Movie.WriteFrame( "ABCD", "abcd" ) );
  ASSERT_TRUE( m_Movie.WriteFrame( "EFGH", "" ) );
  ASSERT_TRUE( m_Movie.WriteFrame( "IJKL", "ijklmnop" ) );
  ASSERT_TRUE( m_Movie.m_Writer.Close() );
  const VEbmlParser File = Parse();
  EXPECT_EQ( File.Text( { Ebml::Head, Ebml::DocType } ), "matroska" );
  EXPECT_EQ( File.Number( { Ebml::Head, Ebml::DocTypeVersion } ), 1u );
  EXPECT_EQ( File.Number( { Ebml::Head, Ebml::DocTypeReadVersion } ), 1u );

  const VEbmlElement& rSegment = File.Find( { Ebml::Segment } );
  EXPECT_EQ( rSegment.m_SizeBytes, 5 );
  EXPECT_FALSE( rSegment.m_bUnknownSize );
  EXPECT_EQ( rSegment.End(), m_Movie.m_pBytes->size() );
  EXPECT_EQ( Ids( rSegment.m_Children ),
    ( std::vector<uint32_t>{ Ebml::SeekHead, Ebml::Void, Ebml::Info, Ebml::Tracks, Ebml::Tags, Ebml::Cluster, Ebml::Cluster, Ebml::Cluster,
      Ebml::Cues } ) );
  EXPECT_EQ( rSegment.m_Children[2].m_Position - rSegment.m_Data, 2003u ) << "the place of the seek head";

  std::vector<std::string> Blocks;
  for( const VMatroskaBlock& rBlock : ReadBlocks( File ) )
  {
    EXPECT_EQ( rBlock.m_Time % Period, 0u );
    EXPECT_EQ( rBlock.m_Duration, Period );
    Blocks.push_back( "track " + std::to_string( rBlock.m_Track ) + ", frame " + std::to_string( rBlock.m_Time / Period ) + ": " +
      std::string( rBlock.m_Data.begin(), rBlock.m_Data.end() ) );
  }
  EXPECT_EQ( Blocks,
    ( std::vector<std::string>{ "track 1, frame 0: ABCD", "track 2, frame 0: abcd", "track 1, frame 1: EFGH", "track 1, frame 2: IJKL",
      "track 2, frame 2: ijklmnop" } ) );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( MkvWriter, InfoTellsScaleDurationAndMakers )
{
  const auto In = []( uint32_t i_Id ) { return VEbmlParser::VPath{ Ebml::Segment, Ebml::Info, i_Id }; };
  ASSERT_TRUE( m_Movie.Begin() );
  EXPECT_EQ( Parse().Real( In( Ebml::Duration ) ), 0.0 );
  WriteFrames( 7 );
  ASSERT_TRUE( m_Movie.m_Writer.Close() );
  const VEbmlParser File = Parse();
  EXPECT_EQ( File.Number( In( Ebml::TimestampScale ) ), 1000u );
  EXPECT_EQ( File.Real( In( Ebml::Duration ) ), 7.0 * Period );
  EXPECT_EQ( File.Text( In( Ebml::WritingApp ) ), "Tarvo MkvWriter" );
  EXPECT_EQ( File.Text( In( Ebml::MuxingApp ) ).find( "libebml v" ), 0u );
  EXPECT_NE( File.Text( In( Ebml::MuxingApp ) ).find( " + zzlibmatroska v" ), std::string::npos );
  EXPECT_EQ( File.Find( In( Ebml::SegmentUID ) ).m_Size, 16u );
  EXPECT_EQ( File.Find( In( Ebml::DateUTC ) ).m_Size, 8u );
}

TEST_F( MkvWriter, EveryClusterIsInOneSeekHeadAndEveryBlockInTheCues )
{
  constexpr uint64_t Frames = 300;   // more than the main seek head has room for
  ASSERT_TRUE( m_Movie.Begin() );
  WriteFrames( Frames );
  ASSERT_TRUE( m_Movie.m_Writer.Close() );
  const VEbmlParser File = Parse();
  const auto Clusters = File.FindAll( { Ebml::Segment, Ebml::Cluster } );
  ASSERT_EQ( Clusters.size(), Frames );

  const auto SeekHeads = File.FindAll( { Ebml::Segment, Ebml::SeekHead } );
  ASSERT_EQ( SeekHeads.size(), 2u );
  EXPECT_EQ( SeekHeads[1]->End(), m_Movie.m_pBytes->size() );
  // Entries until fewer than 75 of 2000 bytes are left, then those of Cues and the secondary seek head
  EXPECT_GT( SeekHeads[0]->m_Size, 2000u - 75u );
  EXPECT_LE( SeekHeads[0]->m_Size, 2000u );
  std::vector<uint64_t> Indexed;
  std::vector<uint32_t> Others;
  for( const VMatroskaSeek& rSeek : ReadSeeks( File ) )
  {
    EXPECT_EQ( IdAt( File, rSeek.m_Position ), rSeek.m_Id );
    rSeek.m_Id == Ebml::Cluster ? Indexed.push_back( rSeek.m_Position ) : Others.push_back( rSeek.m_Id );
  }
  EXPECT_EQ( Others, ( std::vector<uint32_t>{ Ebml::Info, Ebml::Tracks, Ebml::Tags, Ebml::Cues, Ebml::SeekHead } ) );

  const auto Cues = ReadCues( File );
  ASSERT_EQ( Cues.size(), 2 * Frames );
  for( uint64_t Frame = 0; Frame < Frames; ++Frame )
  {
    EXPECT_EQ( Indexed.at( Frame ), Clusters[Frame]->m_Position );
    for( const uint64_t Track : { 1u, 2u } )
    {
      const VMatroskaCue& rCue = Cues[2 * Frame + Track - 1];
      EXPECT_EQ( rCue.m_Time, Frame * Period );
      EXPECT_EQ( rCue.m_Track, Track );
      EXPECT_EQ( rCue.m_Cluster, Clusters[Frame]->m_Position );
    }
  }
}

TEST_F( MkvWriter, WithoutFramesThereAreTagsAndNoCues )
{
  VHeader& rHeader = m_Movie.m_Header;
  rHeader.m_Attributes.Set( "Text", "gr\xC3\xBC\xC3\x9F & <Gott>" );
  rHeader.m_Attributes.Set( "Saturation", "the caller's" );   // gives way
  ASSERT_TRUE( m_Movie.Begin() && m_Movie.m_Writer.Close() );
  const VEbmlParser File = Parse();
  const VEbmlElement& rSegment = File.Find( { Ebml::Segment } );
  EXPECT_EQ( Ids( rSegment.m_Children ), ( std::vector<uint32_t>{ Ebml::SeekHead, Ebml::Void, Ebml::Info, Ebml::Tracks, Ebml::Tags } ) );
  EXPECT_FALSE( rSegment.m_bUnknownSize );
  auto Tags = ReadTags( File );
  EXPECT_EQ( Tags["Tarvo.External.Text"], "gr\xC3\xBC\xC3\x9F & <Gott>" );
  EXPECT_EQ( Tags["Tarvo.External.Saturation"], "1" );
  const auto Targets = File.FindAll( { Ebml::Segment, Ebml::Tags, Ebml::Tag, Ebml::Targets } );
  ASSERT_EQ( Targets.size(), 1u );
  EXPECT_EQ( Ids( Targets[0]->m_Children ), std::vector<uint32_t>{ Ebml::TagAttachmentUID } );
}

TEST_F( MkvWriter, WithoutSoundThereIsOneTrack )
{
  m_Movie.m_Header.m_Audio = {};
  ASSERT_TRUE( m_Movie.Begin() );
  EXPECT_TRUE( m_Movie.WriteFrame( "ABCD", "aabb" ) );
  ASSERT_TRUE( m_Movie.m_Writer.Close() );
  const VEbmlParser File = Parse();
  EXPECT_EQ( File.FindAll( { Ebml::Segment, Ebml::Tracks, Ebml::TrackEntry } ).size(), 1u );
  EXPECT_EQ( ReadBlocks( File ).size(), 1u );
  EXPECT_EQ( ReadCues( File ).size(), 1u );
  EXPECT_EQ( ReadTags( File ).at( "Tarvo.Internal.AudioFrameInfo.Present" ), "false" );
}

TEST_F( MkvWriter, TheCodecIsTold )
{
  const auto InTrack = []( uint32_t i_Id ) { return VEbmlParser::VPath{ Ebml::Segment, Ebml::Tracks, Ebml::TrackEntry, i_Id }; };
  m_Movie.m_Header.m_Video = VideoInfo( IPixelFormat::EU8Y8V8Y8, 0x0102, 0x0304 );
  ASSERT_TRUE( m_Movie.Begin() );
  const VEbmlParser File = Parse();
  EXPECT_EQ( File.Text( InTrack( Ebml::CodecID ) ), "V_MS/VFW/FOURCC" );
  VLittleEndian BitmapHeader;
  BitmapHeader.U32( 40 ).U32( 0x0102 ).U32( 0x0304 ).U16( 1 ).U16( 0 ).Raw( "UYVY" ).U32( 0 ).Zeros( 16 );   // planes, bits, FourCC, image size
  EXPECT_EQ( File.BytesOf( File.Find( InTrack( Ebml::CodecPrivate ) ) ), BitmapHeader.m_Bytes );

  VSmallMovie Compressed;
  Compressed.m_Header.m_Payload = IVideoPayload::EImageJPEG;
  Compressed.m_Header.m_Video = VideoInfo( IPixelFormat::EU10Y10V10Y10, 48, 2 );
  ASSERT_TRUE( Compressed.Begin() );
  const VEbmlParser JPEGFile( *Compressed.m_pBytes );
  EXPECT_EQ( JPEGFile.Text( InTrack( Ebml::CodecID ) ), "V_MJPEG" );
  EXPECT_TRUE( JPEGFile.FindAll( InTrack( Ebml::CodecPrivate ) ).empty() );
  EXPECT_EQ( ReadTags( JPEGFile ).at( "Tarvo.Internal.VideoFrameInfo.PixelFormat" ), "R8G8B8" ) << "the format that is compressed";
}

// A codec that no payload of ours selects so far.
TEST_F( MkvWriter, AColourSpaceStandsAmongThePicturesFields )
{
  libmatroska::KaxTracks Tracks;
  FillVideoTrack( Tracks, VideoInfo(), { "V_UNCOMPRESSED", EFourCCPlace::ColourSpace, "UYVY" }, 1 );
  libebml::MemIOCallback Memory;
  Tracks.Render( Memory );
  const VEbmlParser File( { Memory.GetDataBuffer(), Memory.GetDataBuffer() + Memory.GetDataBufferSize() } );
  EXPECT_EQ( File.Text( { Ebml::Tracks, Ebml::TrackEntry, Ebml::CodecID } ), "V_UNCOMPRESSED" );
  EXPECT_EQ( File.Text( { Ebml::Tracks, Ebml::TrackEntry, Ebml::Video, Ebml::UncompressedFourCC } ), "UYVY" );
  EXPECT_TRUE( File.FindAll( { Ebml::Tracks, Ebml::TrackEntry, Ebml::CodecPrivate } ).empty() );
}

TEST_F( MkvWriter, RefusalsSayWhy )
{
  ASSERT_TRUE( m_Movie.Begin() );
  EXPECT_FALSE( m_Movie.WriteFrame( "ABCDE", "" ) );
  VDescription Turned;
  Turned.m_Video = VideoInfo( IPixelFormat::ELuminance8, 2, 2 );
  EXPECT_FALSE( Turned.WriteFrame( m_Movie.m_Writer, VBytes( 4 ) ) );
  const auto TakesRate = []( const VTimingRecord& i_rTiming )
  {
    VSmallMovie Movie;
    Movie.m_Header.m_Timing = i_rTiming;
    return Movie.Begin() && Movie.WriteFrame( "ABCD", "" ) && Movie.WriteFrame( "ABCD", "" ) && Movie.m_Writer.Close();
  };
  EXPECT_TRUE( TakesRate( { 1, 4, 0 } ) );
  EXPECT_FALSE( TakesRate( { 1, 5, 0 } ) );
  EXPECT_FALSE( TakesRate( { 0, 1, 0 } ) );
  EXPECT_TRUE( TakesRate( {} ) );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Unexpected total size of buffers provided.", "A frame of 2 x 2 pixels does not fit the file's 4 x 1.",
      "A frame period of 5000000000 ns is longer than the 4294967295 ns that can be stored.", "A rate of 0 ticks a second gives no frame period.",
      "The frame rate is not known: all frames are stored at the same time." } ) );
}
