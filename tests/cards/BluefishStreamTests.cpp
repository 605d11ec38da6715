// A virtual card's buffers, frame by frame under a clock moved by hand. Records are packed: a plus copies the field that a check would bind to.
#include "tests/cards/BluefishClient.h"

using namespace BluefishTests;
using BluefishStream = VBluefishFixture;

namespace
{

constexpr uint32_t Mode576i = 0;
constexpr uint32_t Mode720p50 = 16;

constexpr uint32_t AllChannels = 0x3FCFF;   // 1 to 8, and 9 to 16 behind the two analogue ones

}

TEST_F( BluefishStream, ANamedBufferIsWholeAtTheNextSyncButOne )
{
  Play( "bluefish444:standard=SD_720_576I_5000,pattern=counter,audio=ramp,timecode=23:59:59:20" );
  const std::optional<uint32_t> First = CounterIn( 0, Mode576i );
  ASSERT_TRUE( First );
  std::optional<uint64_t> LastCount;
  for( uint32_t Round = 1; Round < 8; ++Round )
  {
    Name( ( Round + 1 ) % 3 );
    const std::optional<uint64_t> Count = Sync();
    ASSERT_TRUE( Count );
    EXPECT_EQ( *Count, LastCount.value_or( *Count - 2 ) + 2 );
    LastCount = Count;
    const uint32_t Readable = Round % 3;
    EXPECT_EQ( CounterIn( Readable, Mode576i ), *First + Round );
    const VDecoded Decoded = Decode( Readable, AllChannels, SampleFlag::Bits16, 2002 );
    EXPECT_TRUE( Decoded.m_bDone );
    EXPECT_EQ( +Decoded.m_Record.m_Samples, 1920u * 16 );
    EXPECT_EQ( TestSupport::ReadRamp( { Decoded.m_Samples.data(), 1920, 16, 2 }, 16 ), static_cast<uint16_t>( ( *First + Round ) * 1920 ) );
  }
  EXPECT_EQ( CounterIn( 7, Mode576i ), std::nullopt ) << "never filled";
  EXPECT_FALSE( m_Object.Capture( 8 ) ) << "the card has no such buffer";
}

TEST_F( BluefishStream, APlainNameTakesTheImageAndOthersTakeAncillaryData )
{
  Plug( "bluefish444:standard=SD_720_576I_5000,pattern=counter" );
  m_Object.SetUp( 2, MemoryFormat::TwoVUY );
  Sync();
  ASSERT_TRUE( m_Object.Capture( 3 ) );
  ASSERT_TRUE( m_Object.Capture( 4 | Buffer::Hanc ) );
  Sync();
  ASSERT_TRUE( m_Object.Capture( 5 | Buffer::ImageHanc ) );
  Sync();
  const auto First = CounterIn( 3, Mode576i );
  ASSERT_TRUE( First );
  EXPECT_FALSE( Decode( 3, 3, SampleFlag::Bits16, 1920 ).m_bDone );
  EXPECT_EQ( CounterIn( 4, Mode576i ), std::nullopt );
  EXPECT_TRUE( Decode( 4, 3, SampleFlag::Bits16, 1920 ).m_bDone );
  for( uint32_t Frame = 1; Frame < 4; ++Frame )
  {
    Sync();
    EXPECT_EQ( CounterIn( 5, Mode576i ), *First + Frame ) << "a name stays in force";
    EXPECT_TRUE( Decode( 5, 3, SampleFlag::Bits16, 1920 ).m_bDone );
  }
  EXPECT_EQ( CounterIn( 3, Mode576i ), First ) << "a buffer keeps what it holds";
}

TEST_F( BluefishStream, DeliversEveryMemoryFormat )
{
  using KVZ::IPixelFormat;
  const std::pair<uint32_t, IPixelFormat::Enum> Formats[] = { { 2, IPixelFormat::EY8U8Y8V8 }, { 3, IPixelFormat::EU10Y10V10Y10 },
    { 4, IPixelFormat::ER8G8B8u8 }, { 6, IPixelFormat::EB8G8R8u8 }, { 8, IPixelFormat::EU8Y8V8Y8 }, { 9, IPixelFormat::EB8G8R8 },
    { 16, IPixelFormat::ER8G8B8 }, { 17, IPixelFormat::ELuminance8 } };
  Plug( "bluefish444:standard=HD_1280_720P_5000,pattern=counter" );
  for( const auto& [Memory, Format] : Formats )
  {
    SCOPED_TRACE( KVZ::ToName( Format ) );
    m_Object.SetUp( 2, Memory );
    Begin();
    const auto Image = ReadImage( 0, Mode720p50, Memory );
    EXPECT_TRUE( TestSupport::ReadCounter( { Format, Image.data(), BlueVelvetLineBytes( Functions(), Mode720p50, Memory ) } ) );
  }
  EXPECT_FALSE( m_Object.Set( Property::VideoInputMemoryFormat, 5 ) );
}

TEST_F( BluefishStream, DecodesTheChannelsAndSamplesAskedFor )
{
  Play( "bluefish444:standard=SD_720_486I_5994,audio=ramp,channels=10,timecode=00:00:59;28" );
  // Channels 9 and 10 exist, 11 does not; the bits between belong to the analogue outputs
  const VDecoded Eleven = Decode( 0, 0xFF | 7u << 10, SampleFlag::Bits24, 2002 );
  ASSERT_TRUE( Eleven.m_bDone );
  const uint32_t Samples = Eleven.m_Record.m_Samples / 11;
  EXPECT_TRUE( Samples == 1601 || Samples == 1602 ) << Samples;
  EXPECT_TRUE( TestSupport::ReadRamp( { Eleven.m_Samples.data(), Samples, 11, 3 }, 10 ) );
  // No more than there is room for
  const VDecoded Few = Decode( 0, 3, SampleFlag::Bits32, 100 );
  EXPECT_EQ( +Few.m_Record.m_Samples, 200u );
  EXPECT_TRUE( TestSupport::ReadRamp( { Few.m_Samples.data(), 100, 2, 4 }, 2 ) );
  EXPECT_EQ( Few.m_Samples[800], 0xAA );
}

// At 50 frames a second each label comes on two frames, the second with the field mark, which lies beside the tens of hours.
TEST_F( BluefishStream, TimecodeWordsHoldTheLabelInBCD )
{
  const auto WordAt = [this]( uint32_t i_Place ) { return uint64_t{ Decode( 1, 0, 0, 0 ).m_Record.m_Timecodes[i_Place] }; };
  Play( "bluefish444:standard=SD_720_486I_5994" );
  Event( R"({"do": "timecode-jump", "to": "21:43:05;28"})" );
  Sync();
  constexpr uint64_t Word = 0x02'01'04'03'00'05'06'08;   // tens and units of hours, minutes, seconds, frames; drop-frame beside the tens of frames
  EXPECT_EQ( WordAt( TimecodePlace::RP188LTC ), Word );
  EXPECT_EQ( WordAt( TimecodePlace::RP188VITC ), Word );
  EXPECT_EQ( WordAt( TimecodePlace::SDVITC ), Word );
  EXPECT_EQ( WordAt( TimecodePlace::ExternalLTC ), 0u ) << "nothing is plugged in there";

  Event( R"({"do": "format", "standard": "HD_1280_720P_5000"})" );
  Event( R"({"do": "timecode-jump", "to": "01:00:00:00"})" );
  Sync();
  EXPECT_EQ( m_Object.Query( Property::VideoInputSignalVideoMode ), Mode720p50 ) << "detected with its first frame";
  EXPECT_EQ( WordAt( TimecodePlace::RP188LTC ), 0x00'01'00'00'00'00'00'00u );
  Sync();
  EXPECT_EQ( WordAt( TimecodePlace::RP188LTC ), 0x08'01'00'00'00'00'00'00u );

  Event( R"({"do": "timecode-loss"})" );
  Sync();
  Sync();
  EXPECT_EQ( WordAt( TimecodePlace::RP188LTC ), 0u ) << "left as it was";
}

// A frame that comes while the client is still busy with the one before is held until it waits again.
TEST_F( BluefishStream, AClientThatIsBusyIsWaitedFor )
{
  Play( "bluefish444:standard=SD_720_576I_5000,pattern=counter" );
  Name( 1 );
  const auto Before = Sync();
  boost::thread Card( [&] { EXPECT_TRUE( Control().Step( m_Card, 3 ) ); } );
  for( uint64_t Frame = 1; Frame <= 3; ++Frame )
  {
    const auto Count = m_Object.Wait();
    ASSERT_TRUE( Before && Count );
    EXPECT_EQ( *Count, *Before + 2 * Frame );
  }
  Card.join();
  EXPECT_EQ( Counters().m_FramesWithoutBuffer, 0u );
}

// So is a removal: the last frame before it is not lost to a client that has yet to read it.
TEST_F( BluefishStream, ACardIsNotTakenOutUnderABusyClient )
{
  Play( "bluefish444:standard=SD_720_576I_5000,pattern=counter" );
  Name( 0 );
  const auto First = CounterIn( 0, Mode576i );
  Sync();
  Event( R"({"do": "remove"})" );
  boost::thread Card = PassOne();
  for( int Reading = 0; Reading < 20; ++Reading )
  {
    EXPECT_EQ( CounterIn( 1, Mode576i ), *First + 1 );
  }
  EXPECT_FALSE( m_Object.Wait() );
  Card.join();
}

// Were it not so, a slow client would read what its buffers held before a short loss, and take it for new.
TEST_F( BluefishStream, ALossOfSignalWaitsUntilTheClientKnows )
{
  Play( "bluefish444:standard=SD_720_576I_5000,pattern=counter" );
  EXPECT_EQ( m_Object.Query( Property::VideoInputSignalVideoMode ), Mode576i );
  Event( R"({"do": "signal-loss", "frames": 1})" );
  Sync();
  boost::thread Card = PassOne();
  EXPECT_EQ( m_Object.Query( Property::VideoInputSignalVideoMode ), NoSignal );
  Card.join();
  EXPECT_EQ( m_Object.Query( Property::VideoInputSignalVideoMode ), Mode576i );
  EXPECT_EQ( Counters().m_FramesWithoutBuffer, 0u );
}

TEST_F( BluefishStream, InputsWorkOnTheirOwn )
{
  Plug( "bluefish444:inputs=4,standard=SD_720_576I_5000,pattern=counter" );
  for( uint32_t Channel = 5; Channel >= 2; --Channel )
  {
    SCOPED_TRACE( Channel );
    ASSERT_TRUE( m_Object.Set( Property::DefaultVideoInputChannel, Channel ) );
    EXPECT_FALSE( m_Object.Capture( 0 ) ) << "its way to the frame store is not open yet";
    EXPECT_FALSE( m_Object.Set( Property::RoutingMatrix, 0x30000505 ) );
    m_Object.SetUp( Channel, MemoryFormat::TwoVUY );
    Begin();
    EXPECT_TRUE( CounterIn( 0, Mode576i ) );
    EXPECT_EQ( Functions().bfcVideoCaptureStop( m_Object.m_Handle ), 0 );
  }
}

// Nobody must be left waiting: not the client for a sync that never comes, nor the card for a client that has gone.
TEST_F( BluefishStream, ACardThatGoesLetsItsClientGo )
{
  Play( "bluefish444:standard=SD_720_576I_5000" );
  Event( R"({"do": "remove"})" );
  EXPECT_FALSE( Sync() );
  EXPECT_FALSE( m_Object.Capture( 0 ) );
  std::vector<uint8_t> Image( 4096 );
  EXPECT_FALSE( m_Object.Read( Image, 0 ) );
  Event( R"({"do": "arrive"})" );
  Step();
  EXPECT_TRUE( m_Object.Capture( 0 ) );

  boost::thread Client( [&] { EXPECT_FALSE( m_Object.Wait() ); } );
  ASSERT_TRUE( Control().RemoveCard( m_Card ) );
  Client.join();
}
