#include "FileIO/MovIO/MovTiming.h"
#include "FileIO/WriterSupport/AttributeBlock.h"
#include "Utils/UtilsIO/StreamAdapters.h"
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

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

// Timescale and sample periods of a file without frames, by its tables.
struct VTimes
{
  uint64_t m_Timescale;
  uint64_t m_Video;
  uint64_t m_Audio;
  uint64_t m_Timecode;
  bool operator==( const VTimes& ) const = default;
};

std::ostream& operator<<( std::ostream& o_rOut, const VTimes& i_rTimes )
{
  return o_rOut << i_rTimes.m_Timescale << " " << i_rTimes.m_Video << " " << i_rTimes.m_Audio << " " << i_rTimes.m_Timecode;
}

const VMovAtom& SampleTable( const VMovParser& i_rParser, size_t i_Track )
{
  return i_rParser.Root().Child( "moov" ).Child( "trak", i_Track ).Child( "mdia" ).Child( "minf" ).Child( "stbl" );
}

VTimes TimesOf( const VMovieSettings& i_rSettings )
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
struct VStart
{
  uint64_t m_Frame;
  uint64_t m_Flags;
  uint64_t m_FramesPerSecond;
  uint64_t m_Remainder;
  bool operator==( const VStart& ) const = default;
};

std::ostream& operator<<( std::ostream& o_rOut, const VStart& i_rStart )
{
  return o_rOut << i_rStart.m_Frame << " " << i_rStart.m_Flags << " " << i_rStart.m_FramesPerSecond << " " << i_rStart.m_Remainder;
}

VStart StartOf( const ITimecode& i_rTimecode, uint32_t i_Period = 5400000 )
{
  VMovieSettings Settings = WithTimes( i_Period, i_rTimecode.m_Standard, 48000 );
  Settings.m_Timecode = i_rTimecode;
  VSmallMovie Movie( Settings );
  EXPECT_TRUE( Movie.Begin() && Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  const auto& rStsd = SampleTable( Parser, 2 ).Child( "stsd" );
  const auto& rTrack = Parser.Track( "tmcd" );
  const VBytes Number = Parser.Bytes( rTrack.m_Samples.at( 0 ) );
  const uint64_t Frame = uint64_t{ Number.at( 0 ) } << 24 | Number.at( 1 ) << 16 | Number.at( 2 ) << 8 | Number.at( 3 );
  // Said in three places.
  const auto& rTrak = Parser.Root().Child( "moov" ).Child( "trak", 2 );
  EXPECT_EQ( Parser.Number( rTrak.Child( "tkhd" ), 20 ), rTrack.m_EditStart );
  EXPECT_EQ( Parser.Number( SampleTable( Parser, 2 ).Child( "stts" ), 12 ), rTrack.m_EditStart );
  return { Frame, Parser.Number( rStsd, 28 ), Parser.Number( rStsd, 40, 1 ), rTrack.m_EditStart };
}

}

TEST_F( MovWriter, EveryPeriodIsAWholeNumberOfUnits )
{
  EXPECT_EQ( TimesOf( WithTimes( 5400000, VStandard::ETimecode25, 48000 ) ), ( VTimes{ 48000, 1920, 1, 1920 } ) );
  EXPECT_EQ( TimesOf( WithTimes( 4504500, VStandard::ETimecode30Drift, 0 ) ), ( VTimes{ 30000, 1001, 0, 1001 } ) );
  EXPECT_EQ( TimesOf( WithTimes( 4504500, VStandard::ETimecode30Drop, 48000 ) ), ( VTimes{ 240000, 8008, 5, 8008 } ) );
  EXPECT_EQ( TimesOf( WithTimes( 2252250, VStandard::ETimecode30Drop, 48000 ) ), ( VTimes{ 240000, 4004, 5, 8008 } ) );
  EXPECT_EQ( TimesOf( WithTimes( 5630625, VStandard::ETimecode24Drift, 48000 ) ), ( VTimes{ 48000, 2002, 1, 2002 } ) );
  // 1080 MHz is no multiple of this rate: the period is cut off.
  EXPECT_EQ( TimesOf( WithTimes( 5400000, VStandard::ETimecode25, 44100 ) ), ( VTimes{ 40000000, 1600000, 907, 1600000 } ) );
  // Without a frame rate.
  EXPECT_EQ( TimesOf( WithTimes( 0, VStandard::ETimecode25, 0 ) ), ( VTimes{ 25, 0, 0, 1 } ) );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( MovWriter, TimesThatNoFieldCanHoldAreRefused )
{
  const auto Refuses = [&]( const VMovieSettings& i_rSettings )
  {
    VSmallMovie Movie( i_rSettings );
    return !Movie.Begin() && !Movie.m_Writer.Close();
  };
  VMovieSettings Settings = WithTimes( 0x20000000, VStandard::ETimecode25, 0 );   // eight base ticks each
  EXPECT_TRUE( Refuses( Settings ) );
  Settings.m_Timing = { 0, 1, 0 };
  EXPECT_TRUE( Refuses( Settings ) );
  EXPECT_EQ( m_Log.Texts().back(), "A frame period of 1 ticks of 1/0 s cannot be represented in 32 bits at 1080000000 Hz." );
  Settings = WithTimes( 5400000, VStandard::ETimecode25, 0 );
  Settings.m_Timecode.m_Days = 2000;
  EXPECT_TRUE( Refuses( Settings ) );
  EXPECT_EQ( m_Log.Texts().back(), "Timecode cannot be represented as 32 bit frame count." );
  Settings.m_Timecode.m_Days = -1;
  EXPECT_TRUE( Refuses( Settings ) );
  // Frames of H.264 are shown three periods later.
  Settings = WithTimes( 0, VStandard::ETimecode25, 0 );
  Settings.m_Timing = { 1080000000, 1500000001, 0 };
  EXPECT_TRUE( VSmallMovie( Settings ).Begin() );
  Settings.m_Payload = IVideoPayload::EVideoH264;
  EXPECT_TRUE( Refuses( Settings ) );
  EXPECT_EQ( m_Log.Texts().back(), "Video frame period, timecode period or audio sample period cannot be represented in 32 bits." );
}

TEST_F( MovWriter, DescriptionsThatNoFieldCanHoldAreRefused )
{
  VMovieSettings Settings = VMovieSettings::Silent();
  Settings.m_Video.m_ImageWidth = 65536;
  EXPECT_FALSE( VSmallMovie( Settings ).Begin() );
  Settings.m_Video.m_ImageWidth = 65535;
  EXPECT_TRUE( VSmallMovie( Settings ).Begin() );
  Settings = {};
  Settings.m_Audio = { IAudioSampleFormat::EUInt8, 96000, 1 };
  EXPECT_FALSE( VSmallMovie( Settings ).Begin() );
  Settings.m_Audio = { IAudioSampleFormat::EInt16, 96000, 17 };
  EXPECT_FALSE( VSmallMovie( Settings ).Begin() );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "An image of 65536 x 2 pixels is larger than the 65535 x 65535 that the file can say.",
      "A sample rate of 96000 is more than the 65535 that the file can say of 8-bit samples.", "Cannot support 17 channels of audio." } ) );
}

TEST_F( MovWriter, TheTimecodeStartsWhereTheCallerSays )
{
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 10, 11, 12, 13 } ), ( VStart{ 916813, 0, 25, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode30Drop, 0, 1, 0, 2 } ), ( VStart{ 1800, 1, 30, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode30Drop, 0, 10, 0, 0 } ), ( VStart{ 17982, 1, 30, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode30Drop, 0, 0, 0, 0, 0, 1 } ), ( VStart{ 2589408, 1, 30, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode24Drift, 23, 59, 59, 23, 0, 1 } ), ( VStart{ 4147199, 0, 24, 0 } ) );
  // Half a frame, in ticks of 1/1080000000 s.
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 0, 0, 1, 0, 0, 0, 21600000 } ), ( VStart{ 25, 0, 25, 960 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 0, 0, 1, 0, 0, 0, 43199999 } ), ( VStart{ 25, 0, 25, 1919 } ) );
}

TEST_F( MovWriter, AnInvalidTimecodeCountsInTheStandardThatFitsTheFrames )
{
  const auto StandardOf = [&]( uint32_t i_Period ) { return GetStartTimecode( { VStandard::ETimecodeNone }, i_Period ).m_Standard; };
  EXPECT_EQ( StandardOf( 36000000 ), VStandard::ETimecode30 );
  EXPECT_EQ( StandardOf( 18000000 ), VStandard::ETimecode30 );
  EXPECT_EQ( StandardOf( 36036000 ), VStandard::ETimecode30Drift );
  EXPECT_EQ( StandardOf( 18018000 ), VStandard::ETimecode30Drift );
  EXPECT_EQ( StandardOf( 43200000 ), VStandard::ETimecode25 );
  EXPECT_EQ( StandardOf( 21600000 ), VStandard::ETimecode25 );
  EXPECT_EQ( StandardOf( 45000000 ), VStandard::ETimecode24 );
  EXPECT_EQ( StandardOf( 45045000 ), VStandard::ETimecode24Drift );
  EXPECT_EQ( StandardOf( 44999999 ), VStandard::ETimecode30 );
  EXPECT_EQ( StandardOf( 0 ), VStandard::ETimecode30 );
  // Labels that drop-frame leaves out, frames and a remainder at their limit; the counters stay.
  EXPECT_EQ( StartOf( { VStandard::ETimecode30Drop, 0, 1, 0, 1 }, 4504500 ), ( VStart{ 1801, 0, 30, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 0, 0, 1, 25 } ), ( VStart{ 50, 0, 25, 0 } ) );
  EXPECT_EQ( StartOf( { VStandard::ETimecode25, 0, 0, 1, 0, 0, 0, 43200000 } ), ( VStart{ 26, 0, 25, 0 } ) );
  EXPECT_EQ( StartOf( {}, 5625000 ), ( VStart{ 0, 0, 24, 0 } ) );
}

TEST_F( MovWriter, FramesLieOneAfterAnotherEachWithItsSound )
{
  VSmallMovie Movie;
  ASSERT_TRUE( Movie.Begin() );
  VBytes MediaData = { 0, 1, 0x5F, 0x90 };
  const auto AddFrame = [&]( uint8_t i_Number, size_t i_AudioBytes )
  {
    const VBytes Video( 16, i_Number );
    const VBytes Audio( i_AudioBytes, static_cast<uint8_t>( 0x80 + i_Number ) );
    EXPECT_TRUE( Movie.Frame( Video, Audio ) );
    MediaData.insert( MediaData.end(), Video.begin(), Video.end() );
    MediaData.insert( MediaData.end(), Audio.begin(), Audio.end() );
  };
  AddFrame( 1, 6 );
  AddFrame( 2, 0 );   // its sound is missing: no chunk
  AddFrame( 3, 4 );
  ASSERT_TRUE( Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  EXPECT_EQ( Parser.Body( Parser.Root().Child( "mdat" ) ), MediaData );
  const auto& rVideo = Parser.Track( "vide" );
  ASSERT_EQ( rVideo.m_Samples.size(), 3u );
  EXPECT_EQ( Parser.Bytes( rVideo.m_Samples[2] ), VBytes( 16, 3 ) );
  EXPECT_EQ( rVideo.m_MediaDuration, 3 * 1920u );
  const auto& rAudio = Parser.Track( "soun" );
  ASSERT_EQ( rAudio.m_Samples.size(), 2u );
  EXPECT_EQ( Parser.Bytes( rAudio.m_Samples[0] ), VBytes( 6, 0x81 ) );
  EXPECT_EQ( Parser.Bytes( rAudio.m_Samples[1] ), VBytes( 4, 0x83 ) );
  EXPECT_EQ( rAudio.m_MediaDuration, 5u );
  EXPECT_EQ( Parser.Track( "tmcd" ).m_MediaDuration, 3 * 1920u );
}

TEST_F( MovWriter, FramesThatAreNotWhatTheFileSaysAreRefused )
{
  VSmallMovie Movie;
  ASSERT_TRUE( Movie.Begin() );
  const size_t Before = Movie.m_pBytes->size();
  EXPECT_FALSE( Movie.Frame( VBytes( 15 ) ) );
  EXPECT_TRUE( m_Log.Texts().empty() );
  VBufferList Video = { Buffer( VBytes( 16 ) ) };
  VBufferList Audio;
  EXPECT_FALSE( Movie.m_Writer.WriteFrame( Video, VideoInfo( IPixelFormat::EU8Y8V8Y8, 2, 4 ), Audio, {}, 0 ) );
  EXPECT_FALSE( Movie.m_Writer.WriteFrame( Video, VideoInfo( IPixelFormat::ELuminance8, 4, 2 ), Audio, {}, 0 ) );
  Audio = { Buffer( VBytes( 2 ) ) };
  EXPECT_FALSE( Movie.m_Writer.WriteFrame( Video, Movie.m_Header.m_Video, Audio, { IAudioSampleFormat::EUInt16, 48000, 1 }, 0 ) );
  EXPECT_EQ( Movie.m_pBytes->size(), Before );
  EXPECT_TRUE( Movie.Frame( VBytes( 18 ) ) );
  EXPECT_FALSE( Movie.Frame( VBytes( 16 ) ) );
  EXPECT_EQ( m_Log.Texts().back(), "Frame 1 has 16 bytes and cannot follow a first frame with 18." );
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
  size_t Written = 0;
  while( Written < 100 && Movie.Frame( VBytes( 16 ) ) )
  {
    ++Written;
  }
  EXPECT_EQ( Written, 10u );   // 10 x 400000001 is below 4294967295
  EXPECT_EQ( m_Log.Texts(),
    std::vector<std::string>{ "The file is full: with frame 10 its Video track would be longer than 4294967295 units of 1/135000000 s." } );
  EXPECT_TRUE( Movie.m_Writer.Close() );
  EXPECT_EQ( Movie.Parse().Track( "vide" ).m_MediaDuration, 4000000010u );
}

TEST_F( MovWriter, SoundThatIsTooLongIsRefusedToo )
{
  VSmallMovie Movie( WithTimes( 5400000, VStandard::ETimecode25, 44100 ) );   // 907 units a sample
  ASSERT_TRUE( Movie.Begin() );
  EXPECT_TRUE( Movie.Frame( VBytes( 16 ), VBytes( 2 * 4000000 ) ) );
  EXPECT_FALSE( Movie.Frame( VBytes( 16 ), VBytes( 2 * 735356 ) ) );
  EXPECT_TRUE( Movie.Frame( VBytes( 16 ), VBytes( 2 * 735355 ) ) );
  EXPECT_EQ( m_Log.Texts(),
    std::vector<std::string>{ "The file is full: with frame 1 its Audio track would be longer than 4294967295 units of 1/40000000 s." } );
  EXPECT_TRUE( Movie.m_Writer.Close() );
  EXPECT_EQ( Movie.Parse().Track( "soun" ).m_MediaDuration, 4735355u * 907u );
}

TEST_F( MovWriter, AttributesAreRescaledAndKeptWhateverTheyAre )
{
  VMovieSettings Settings;
  Settings.m_Timing = { 30000, 1001, -7 };
  Settings.m_Timecode = { VStandard::ETimecode25, 0, 0, 0, 25 };   // invalid
  Settings.m_Colour = { 0.5f, 2.0f };
  Settings.m_Attributes.Set( "Saturation", "the caller's" );
  Settings.m_Attributes.Set( "Take", int32_t{ 3 } );
  VSmallMovie Movie( Settings );
  ASSERT_TRUE( Movie.Begin() && Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  const VBytes Body = Parser.Body( Parser.Root().Child( "TMSL" ) );
  ISimpleInputStreamAdapter Stream( Body );
  IVideoAttributes Internal;
  IVideoAttributes External;
  std::string Error;
  ASSERT_TRUE( WriterSupport::ReadAttributeBlock( Stream, Body.size(), Internal, Error ) ) << Error;
  ASSERT_TRUE( WriterSupport::ReadAttributeBlock( Stream, Body.size(), External, Error ) ) << Error;
  EXPECT_TRUE( Stream.IsEnd() );
  VideoFrameInfo Video;
  EXPECT_TRUE( Video.ReadAttributes( Internal ) );
  EXPECT_EQ( Video, Settings.m_Video );
  VTimingRecord Timing;
  EXPECT_TRUE( Timing.ReadAttributes( External ) );
  EXPECT_EQ( Timing, ( VTimingRecord{ 1080000000, 36036000, -252000 } ) );
  VColourRecord Colour;
  EXPECT_TRUE( Colour.ReadAttributes( External ) );
  EXPECT_EQ( Colour, Settings.m_Colour );
  ITimecode Timecode;
  EXPECT_TRUE( ReadAttributes( Timecode, External ) );
  EXPECT_TRUE( IsSameReading( Timecode, Settings.m_Timecode ) );
  EXPECT_EQ( External.Values().size(), 15u );
}

TEST_F( MovWriter, OtherContainersAreRefused )
{
  EXPECT_FALSE( VMovWriter( IVideoContainer::EAVI ).Open( "memory" ) );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "Container must be MOV or MP4." } );
  EXPECT_FALSE( VSmallMovie().m_Writer.WriteStoredFrame( {}, {}, 'I' ) );
}
