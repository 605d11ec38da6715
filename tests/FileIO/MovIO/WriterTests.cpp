#include "FileIO/MovIO/MovTiming.h"
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <array>

using namespace KVZ;
using namespace MovIO;
using namespace TestSupport;

namespace
{

using VStandard = ITimecodeStandard;

class MovWriter : public testing::Test
{
protected:
  const VLogCapture m_Log{ "MovIO" };
};

using VNumbers = std::array<uint64_t, 4>;

// Timescale and sample periods of pictures, sound and timecode, by the tables of a file without frames.
VNumbers TimesOf( const VMovieSettings& i_rSettings )
{
  VSmallMovie Movie( i_rSettings );
  EXPECT_TRUE( Movie.Begin() && Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  const bool bAudio = Parser.Tracks().size() == 3;
  const auto Period = [&]( size_t i_Track ) { return Parser.Number( SampleTable( Parser, i_Track ).Child( "stts" ), 12 ); };
  for( const auto& rTrack : Parser.Tracks() )
  {
    EXPECT_EQ( rTrack.m_Timescale, Parser.Number( Parser.Root().Child( "moov" ).Child( "mvhd" ), 12 ) );
  }
  const auto& rTimecode = SampleTable( Parser, bAudio ? 2 : 1 ).Child( "stsd" );
  return { Parser.Number( rTimecode, 32 ), Period( 0 ), bAudio ? Period( 1 ) : 0, Parser.Number( rTimecode, 36 ) };
}

VMovieSettings WithTimes( uint32_t i_Period, int32_t i_Standard, uint32_t i_SampleRate )
{
  VMovieSettings Settings = i_SampleRate == 0 ? VMovieSettings::Silent() : VMovieSettings();
  Settings.m_Timing.m_FramePeriodInTicks = i_Period;
  Settings.m_Timecode.m_Standard = i_Standard;
  Settings.m_Audio.m_SampleRate = i_SampleRate;
  return Settings;
}

// The timecode's frame number, flags, frames a second and remainder, by the file.
VNumbers StartOf( const ITimecode& i_rTimecode, uint32_t i_Period = 5400000 )
{
  VMovieSettings Settings = WithTimes( i_Period, i_rTimecode.m_Standard, 48000 );
  Settings.m_Timecode = i_rTimecode;
  VSmallMovie Movie( Settings );
  EXPECT_TRUE( Movie.Begin() && Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  const auto& rStsd = SampleTable( Parser, 2 ).Child( "stsd" );
  const auto& rTrack = Parser.Track( "tmcd" );
  // The remainder is said in three places.
  EXPECT_EQ( Parser.Number( Parser.Root().Child( "moov" ).Child( "trak", 2 ).Child( "tkhd" ), 20 ), rTrack.m_EditStart );
  EXPECT_EQ( Parser.Number( SampleTable( Parser, 2 ).Child( "stts" ), 12 ), rTrack.m_EditStart );
  const auto& rMdat = Parser.Root().Child( "mdat" );
  return { Parser.Number( rMdat, 0 ), Parser.Number( rStsd, 28 ), Parser.Number( rStsd, 40, 1 ), rTrack.m_EditStart };
}

}

TEST_F( MovWriter, EveryPeriodIsAWholeNumberOfUnits )
{
  EXPECT_EQ( TimesOf( WithTimes( 5400000, VStandard::ETimecode25, 48000 ) ), ( VNumbers{ 48000, 1920, 1, 1920 } ) );
  EXPECT_EQ( TimesOf( WithTimes( 4504500, VStandard::ETimecode30Drift, 0 ) ), ( VNumbers{ 30000, 1001, 0, 1001 } ) );
  EXPECT_EQ( TimesOf( WithTimes( 4504500, VStandard::ETimecode30Drop, 48000 ) ), ( VNumbers{ 240000, 8008, 5, 8008 } ) );
  EXPECT_EQ( TimesOf( WithTimes( 2252250, VStandard::ETimecode30Drop, 48000 ) ), ( VNumbers{ 240000, 4004, 5, 8008 } ) );
  EXPECT_EQ( TimesOf( WithTimes( 5630625, VStandard::ETimecode24Drift, 48000 ) ), ( VNumbers{ 48000, 2002, 1, 2002 } ) );
  // 1080 MHz is no multiple of this rate: the period is cut off.
  EXPECT_EQ( TimesOf( WithTimes( 5400000, VStandard::ETimecode25, 44100 ) ), ( VNumbers{ 40000000, 1600000, 907, 1600000 } ) );
  // Without a frame rate.
  EXPECT_EQ( TimesOf( WithTimes( 0, VStandard::ETimecode25, 0 ) ), ( VNumbers{ 25, 0, 0, 1 } ) );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( MovWriter, WhatNoFieldCanHoldIsRefusedByName )
{
  const auto Refusal = [&]( const VMovieSettings& i_rSettings )
  {
    VSmallMovie Movie( i_rSettings );
    EXPECT_FALSE( Movie.Begin() || Movie.m_Writer.Close() );
    return m_Log.Texts().back();
  };
  VMovieSettings Settings = WithTimes( 0x20000000, VStandard::ETimecode25, 48000 );   // eight base ticks each
  EXPECT_EQ( Refusal( Settings ), "A frame period of 536870912 ticks of 1/135000000 s cannot be represented in 32 bits at 1080000000 Hz." );
  Settings.m_Timing = { 0, 1, 0 };
  EXPECT_EQ( Refusal( Settings ), "A frame period of 1 ticks of 1/0 s cannot be represented in 32 bits at 1080000000 Hz." );
  Settings.m_Timing = { 1080000000, 1500000001, 0 };
  Settings.m_Video.m_ImageWidth = 65535;
  EXPECT_TRUE( VSmallMovie( Settings ).Begin() );
  Settings.m_Payload = IVideoPayload::EVideoH264;   // whose frames are shown three periods later
  EXPECT_EQ( Refusal( Settings ), "Video frame period, timecode period or audio sample period cannot be represented in 32 bits." );
  for( const int32_t Days : { 2000, -1 } )
  {
    Settings = {};
    Settings.m_Timecode.m_Days = Days;
    EXPECT_EQ( Refusal( Settings ), "Timecode cannot be represented as 32 bit frame count." );
  }
  Settings = {};
  Settings.m_Video.m_ImageWidth = 65536;
  EXPECT_EQ( Refusal( Settings ), "An image of 65536 x 2 pixels is larger than the 65535 x 65535 that the file can say." );
  Settings = {};
  Settings.m_Audio = { IAudioSampleFormat::EUInt8, 96000, 1 };
  EXPECT_EQ( Refusal( Settings ), "A sample rate of 96000 is more than the 65535 that the file can say of 8-bit samples." );
  Settings.m_Audio.m_Channels = 17;
  EXPECT_EQ( Refusal( Settings ), "Cannot support 17 channels of audio." );
  EXPECT_FALSE( VMovWriter( IVideoContainer::EAVI ).Open( "memory" ) );
  EXPECT_EQ( m_Log.Texts().back(), "Container must be MOV or MP4." );
}

TEST_F( MovWriter, TheTimecodeStartsWhereTheCallerSays )
{
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 10, 11, 12, 13 } ), ( VNumbers{ 916813, 0, 25, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode30Drop, 0, 1, 0, 2 } ), ( VNumbers{ 1800, 1, 30, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode30Drop, 0, 10, 0, 0 } ), ( VNumbers{ 17982, 1, 30, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode30Drop, 0, 0, 0, 0, 0, 1 } ), ( VNumbers{ 2589408, 1, 30, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode24Drift, 23, 59, 59, 23, 0, 1 } ), ( VNumbers{ 4147199, 0, 24, 0 } ) );
  // Half a frame, in ticks of 1/1080000000 s.
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 0, 0, 1, 0, 0, 0, 21600000 } ), ( VNumbers{ 25, 0, 25, 960 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 0, 0, 1, 0, 0, 0, 43199999 } ), ( VNumbers{ 25, 0, 25, 1919 } ) );
}

TEST_F( MovWriter, AnInvalidTimecodeCountsInTheStandardThatFitsTheFrames )
{
  const std::pair<uint32_t, VStandard::Enum> Standards[] = { { 36000000, VStandard::ETimecode30 }, { 36036000, VStandard::ETimecode30Drift },
    { 43200000, VStandard::ETimecode25 }, { 45000000, VStandard::ETimecode24 }, { 45045000, VStandard::ETimecode24Drift } };
  const auto StandardOf = []( uint32_t i_Period ) { return GetStartTimecode( { VStandard::ETimecodeNone }, i_Period ).m_Standard; };
  for( const auto& [Period, Standard] : Standards )
  {
    EXPECT_EQ( StandardOf( Period ), Standard );
    EXPECT_EQ( StandardOf( Period / 2 ), Standard );
  }
  EXPECT_EQ( StandardOf( 44999999 ), VStandard::ETimecode30 );
  EXPECT_EQ( StandardOf( 0 ), VStandard::ETimecode30 );
  // Labels that drop-frame leaves out, frames and a remainder at their limit; the counters stay.
  EXPECT_EQ( StartOf( { VStandard::ETimecode30Drop, 0, 1, 0, 1 }, 4504500 ), ( VNumbers{ 1801, 0, 30, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 0, 0, 1, 25 } ), ( VNumbers{ 50, 0, 25, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 0, 0, 1, 0, 0, 0, 43200000 } ), ( VNumbers{ 26, 0, 25, 0 } ) );
}

TEST_F( MovWriter, AFrameWithoutSoundHasNoChunkOfIt )
{
  VSmallMovie Movie;
  ASSERT_TRUE( Movie.Begin() );
  ASSERT_TRUE( Movie.Frame( VBytes( 16, 1 ), VBytes( 6, 0x81 ) ) );
  ASSERT_TRUE( Movie.Frame( VBytes( 16, 2 ) ) );
  ASSERT_TRUE( Movie.Frame( VBytes( 16, 3 ), VBytes( 4, 0x83 ) ) );
  ASSERT_TRUE( Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  const auto& rVideo = Parser.Track( "vide" );
  EXPECT_EQ( Parser.Bytes( rVideo.m_Samples.at( 2 ) ), VBytes( 16, 3 ) );
  EXPECT_EQ( rVideo.m_MediaDuration, 3 * 1920u );
  const auto& rAudio = Parser.Track( "soun" );
  ASSERT_EQ( rAudio.m_Samples.size(), 2u );
  EXPECT_EQ( Parser.Bytes( rAudio.m_Samples[1] ), VBytes( 4, 0x83 ) );
  EXPECT_EQ( rAudio.m_MediaDuration, 5u );
  EXPECT_EQ( Parser.Track( "tmcd" ).m_MediaDuration, 3 * 1920u );
}

// The file says one size for all of them.
TEST_F( MovWriter, UncompressedImagesAreAllAsLongAsTheFirst )
{
  VSmallMovie Movie;
  ASSERT_TRUE( Movie.Begin() );
  EXPECT_FALSE( Movie.Frame( VBytes( 15 ) ) );
  EXPECT_TRUE( Movie.Frame( VBytes( 18 ) ) );
  EXPECT_FALSE( Movie.Frame( VBytes( 16 ) ) );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "Frame 1 has 16 bytes and cannot follow a first frame with 18." } );
  EXPECT_TRUE( Movie.m_Writer.Close() );
  EXPECT_EQ( Movie.Parse().Track( "vide" ).m_Samples.size(), 1u );
}

TEST_F( MovWriter, ImagesThatDoNotBeginAsTheyShouldAreRefused )
{
  const std::pair<IVideoPayload::Enum, std::string> Beginnings[] = { { IVideoPayload::EImageJPEG, "\xFF\xD8\xFF" },
    { IVideoPayload::EImagePNG, "\x89PNG\r\n\x1A\n" }, { IVideoPayload::EImageTIFF, std::string( "II\x2A\x00", 4 ) } };
  for( const auto& [Payload, Beginning] : Beginnings )
  {
    SCOPED_TRACE( ToName( Payload ) );
    VMovieSettings Settings = VMovieSettings::Silent();
    Settings.m_Payload = Payload;
    VSmallMovie Movie( Settings );
    ASSERT_TRUE( Movie.Begin() );
    const auto Write = [&]( const std::string& i_rImage ) {
      return Movie.m_Writer.WriteStoredFrame( { { i_rImage.data(), i_rImage.size() } }, {}, 'I' );
    };
    EXPECT_TRUE( Write( Beginning ) );
    EXPECT_TRUE( Write( Beginning + "more" ) );
    std::string Wrong = Beginning;
    Wrong.back() ^= 1;
    EXPECT_FALSE( Write( Wrong ) );
    EXPECT_TRUE( Write( Wrong.substr( 0, Wrong.size() - 1 ) ) );   // too short to tell
    EXPECT_TRUE( Movie.m_Writer.Close() );
    const auto Parser = Movie.Parse();
    ASSERT_EQ( Parser.Track( "vide" ).m_Samples.size(), 3u );
    EXPECT_EQ( Parser.Bytes( Parser.Track( "vide" ).m_Samples[1] ), Bytes( Beginning + "more" ) );
  }
}

// The limit of 32 bits is reached after hours with usual frame rates; here each frame lasts almost three seconds of a fine timescale.
TEST_F( MovWriter, AFileThatIsFullSaysWhichLimitItHasReached )
{
  VSmallMovie Movie( WithTimes( 400000001, VStandard::ETimecode25, 0 ) );
  ASSERT_TRUE( Movie.Begin() );
  for( int Frame = 0; Frame < 10; ++Frame )   // 10 x 400000001 is below 4294967295
  {
    ASSERT_TRUE( Movie.Frame( VBytes( 16 ) ) );
  }
  EXPECT_FALSE( Movie.Frame( VBytes( 16 ) ) );
  EXPECT_TRUE( Movie.m_Writer.Close() );
  EXPECT_EQ( Movie.Parse().Track( "vide" ).m_MediaDuration, 4000000010u );

  VSmallMovie Loud( WithTimes( 5400000, VStandard::ETimecode25, 44100 ) );   // 907 units a sample
  ASSERT_TRUE( Loud.Begin() );
  EXPECT_TRUE( Loud.Frame( VBytes( 16 ), VBytes( 2 * 4000000 ) ) );
  EXPECT_FALSE( Loud.Frame( VBytes( 16 ), VBytes( 2 * 735356 ) ) );
  EXPECT_TRUE( Loud.Frame( VBytes( 16 ), VBytes( 2 * 735355 ) ) );
  EXPECT_TRUE( Loud.m_Writer.Close() );
  EXPECT_EQ( Loud.Parse().Track( "soun" ).m_MediaDuration, 4735355u * 907u );

  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "The file is full: with frame 10 its Video track would be longer than 4294967295 units of 1/135000000 s.",
      "The file is full: with frame 1 its Audio track would be longer than 4294967295 units of 1/40000000 s." } ) );
}
