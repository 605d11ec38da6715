#include "FileIO/MovIO/MovFileCheck.h"
#include "FileIO/MovIO/TrackValidation.h"
#include "Utils/UtilsIO/StreamAdapters.h"
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/ByteBuilder.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace MovIO;
using namespace TestSupport;

namespace
{

using VTexts = std::vector<std::string>;

// Two seconds of 25 frames.
VTrack GoodTrack()
{
  VTrack Track{ "Video", 1 };
  Track.m_Timescale = 48000;
  Track.m_SamplePeriod = 1920;
  Track.AddChunk( 30 );
  Track.AddChunk( 20 );
  return Track;
}

VTexts MessagesOf( const VTrack& i_rTrack, uint32_t i_Timescale, bool i_bValid )
{
  const VLogCapture Log( "MovIO" );
  VTexts Messages;
  EXPECT_EQ( ValidateTrack( i_rTrack, i_Timescale, &Messages ), i_bValid );
  EXPECT_EQ( Log.Texts(), Messages );
  return Messages;
}

VTexts CheckBytes( const VBytes& i_rBytes )
{
  ISimpleInputStreamAdapter Stream( i_rBytes );
  return CheckMovStream( Stream, i_rBytes.size() );
}

VBytes MakeFile( const VMovieSettings& i_rSettings, size_t i_Frames )
{
  VSmallMovie Movie( i_rSettings );
  EXPECT_TRUE( Movie.Begin() );
  for( size_t Frame = 0; Frame < i_Frames; ++Frame )
  {
    EXPECT_TRUE( Movie.Frame( VBytes( 16 ), VBytes( 2 * 1920 ) ) );
  }
  EXPECT_TRUE( Movie.m_Writer.Close() );
  return *Movie.m_pBytes;
}

}

TEST( MovTrackValidation, OnlyATrackWithSamplesIsValid )
{
  VTrack Track = GoodTrack();
  EXPECT_EQ( MessagesOf( Track, 48000, true ), VTexts{} );
  EXPECT_EQ( GetPeriodInBaseTicks( Track ), 43200000u );
  Track.m_ChunkCount = 0;
  EXPECT_EQ( MessagesOf( Track, 48000, false ), VTexts{ "Video track (1) has no chunks." } );
  Track.m_SampleCount = 0;
  EXPECT_EQ( MessagesOf( Track, 48000, false ), VTexts{ "Video track (1) has no samples." } );
}

TEST( MovTrackValidation, TimesThatDoNotAgreeAreTold )
{
  const std::string Inexact = "Video track (1) has a timescale that cannot be exactly represented in 1080MHz ticks.";
  VTrack Track = GoodTrack();
  Track.m_MediaDuration -= 4799;   // not quite 100 ms
  EXPECT_EQ( MessagesOf( Track, 48000, true ), VTexts{ "Video track (1) has a duration that does not match total of duration of its samples." } );
  Track.m_MediaDuration = 84000;
  EXPECT_EQ( MessagesOf( Track, 48000, true ).at( 1 ),
    "Video track (1) has a duration in the file timescale (2s) that doesn't match the duration in the track timescale (1.75s). Difference is 0.25s." );
  Track = GoodTrack();
  Track.m_Timescale = 48001;   // the duration differs by less than 100 ms
  EXPECT_EQ( MessagesOf( Track, 48000, true ), VTexts{ Inexact } );
  Track.m_Timescale = 0;
  EXPECT_EQ( MessagesOf( Track, 48000, true ), VTexts{ Inexact } );
  VTexts Messages;
  EXPECT_EQ( GetPeriodInBaseTicks( Track, &Messages ), 0u );
  Track.m_Timescale = 7;
  EXPECT_EQ( GetPeriodInBaseTicks( Track, &Messages ), uint64_t{ 154285714 } * 1920 );
  EXPECT_EQ( Messages, ( VTexts{ Inexact, Inexact } ) );
  Track.m_Timescale = 11;
  Track.m_SamplePeriod = 11;
  EXPECT_EQ( GetPeriodInBaseTicks( Track, &Messages ), uint64_t{ 98181818 } * 11 );
  EXPECT_EQ( Messages.size(), 2u );
}

TEST( MovFileCheck, FilesOfTheWriterAreRight )
{
  VMovieSettings Settings;
  EXPECT_EQ( CheckBytes( MakeFile( Settings, 3 ) ), VTexts{} );
  Settings.m_Timecode.m_TickRemainder = 21600000;   // the timecode begins before the first image
  EXPECT_EQ( CheckBytes( MakeFile( Settings, 3 ) ), VTexts{} );
  Settings.m_Container = IVideoContainer::EMP4;
  Settings.m_Timing = { 30000, 1001, 0 };
  Settings.m_Timecode = { ITimecodeStandard::ETimecode30Drop, 10 };
  EXPECT_EQ( CheckBytes( MakeFile( Settings, 3 ) ), VTexts{} );
}

TEST( MovFileCheck, FilesThatAreNotFinishedOrDamagedAreTold )
{
  VSmallMovie Unfinished;
  ASSERT_TRUE( Unfinished.Begin() && Unfinished.Frame( VBytes( 16 ) ) );
  EXPECT_EQ( CheckBytes( *Unfinished.m_pBytes ), VTexts{ "The 'mdat' atom at 32 has no valid size." } );
  EXPECT_EQ( CheckBytes( {} ), VTexts{ "The file has no tracks: it was not finished." } );
  EXPECT_EQ( CheckBytes( MakeFile( {}, 0 ) ), ( VTexts{ "Video track (1) has no samples.", "Audio track (2) has no samples." } ) );

  // Cut short anywhere it is never right, and never more is read than there is.
  const VBytes Whole = MakeFile( {}, 1 );

  const uint64_t MoovEnd = VMovParser::OfBytes( Whole ).Root().Child( "moov" ).m_End;
  for( uint64_t Size = 0; Size < MoovEnd; ++Size )
  {
    ASSERT_FALSE( CheckBytes( VBytes( Whole.begin(), Whole.begin() + static_cast<std::ptrdiff_t>( Size ) ) ).empty() ) << Size;
  }
  // Atoms in atoms without an end.
  VBytes Deep;
  for( uint32_t Size = 800000; Size != 0; Size -= 8 )
  {
    Append( Deep, VBigEndian().Atom( Size, "moov" ).m_Bytes );
  }
  EXPECT_EQ( CheckBytes( Deep ), VTexts{ "The atoms at 136 lie too deep in each other." } );
  const VTemporaryFolder Folder;
  EXPECT_EQ( CheckMovFile( Folder.File( "missing.mov" ) ), VTexts{ "The file could not be opened." } );
}
