// What a delivered frame holds: header, image, sound, timecode.
#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Fixture.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Tables.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Timecode.h"

namespace
{

using namespace VideoInputHAL;
using KVZ::ITimecodeSource;

namespace Place = BlueVelvet::TimecodePlace;

TEST_F( Bluefish444Device, AFrameIsOneBlockWithItsHeader )
{
  constexpr uint32_t AudioBytes = 1920 * 2 * 2;
  MakeCapturing( Mode576i, 2 );
  const VReceivedFrame Frame = Next();
  KVZ::VideoFrameInfo Image;
  Image.m_ImageWidth = Fake::Width;
  Image.m_ImageHeight = Fake::Lines;
  Image.m_PixelFormat = UYVY;
  Image.m_InterlacedFormat = KVZ::GetInterlacedFormat( KVZ::IVideoStandard::ESD_720_576I_5000 );
  ExpectHeader( Frame, Image, Fake::ImageBytes, AudioBytes );
  EXPECT_EQ( Frame.m_Audio, std::vector<uint8_t>( AudioBytes, 0x5A ) ) << "decoded after the image, whose rounded end reaches over its place";
  EXPECT_EQ( Frame.m_Period, 5400000 );
  EXPECT_EQ( Frame.m_Index, m_pReceiver->Count() - 1 );
}

TEST_F( Bluefish444Device, TellsTheDecoderWhatIsWanted )
{
  const struct
  {
    KVZ::IAudioSampleFormat::Enum m_Format;
    uint32_t m_Flags;
    uint32_t m_Bytes;
  } Formats[] = { { KVZ::IAudioSampleFormat::EInt16, 8, 2 }, { KVZ::IAudioSampleFormat::EInt24, 0x80, 3 }, { KVZ::IAudioSampleFormat::EInt32, 0, 4 },
    { KVZ::IAudioSampleFormat::EFloat32, 8, 2 } };
  MakeCapturing();
  for( const auto& rFormat : Formats )
  {
    SCOPED_TRACE( KVZ::ToName( rFormat.m_Format ) );
    Order( 9, rFormat.m_Format );
    Resume( 5 );
    EXPECT_EQ( Next().m_Audio.size(), 1920u * 9 * rFormat.m_Bytes );
    EXPECT_EQ( m_Card.m_LastRecord.m_SampleFlags, rFormat.m_Flags );
    EXPECT_EQ( m_Card.m_LastRecord.m_ChannelMask, 0x4FFu ) << "channel 9 lies behind the two analogue ones";
    EXPECT_EQ( m_Card.m_LastRecord.m_MostSamples, 1920u );
  }
}

// A frame carries what the decoder found: never more than there is room for, and no silence in place of what is missing.
TEST_F( Bluefish444Device, ADecoderMayFindFewerSamplesThanTheModeHas )
{
  MakeCapturing( Mode576i, 4 );
  m_Card.m_Samples = 1919;
  const VReceivedFrame Fewer = Next();
  EXPECT_EQ( Fewer.m_Audio.size(), 1919u * 4 * 2 );
  EXPECT_EQ( Fewer.m_Header.m_AudioInfo.m_Channels, 4u );
  m_Card.m_Samples = 0;
  const VReceivedFrame None = Next();
  EXPECT_TRUE( None.m_Audio.empty() );
  EXPECT_TRUE( None.m_Header.m_AudioInfo.IsEmpty() );
  m_Card.m_Samples.reset();
  m_Card.m_bDecodes = false;
  const VReceivedFrame Undecoded = Next();
  EXPECT_TRUE( Undecoded.m_Header.m_AudioInfo.IsEmpty() );
  EXPECT_FALSE( KVZ::IsValid( Undecoded.m_Timecode ) );
}

TEST_F( Bluefish444Device, AModeWithoutAFramePeriodHasNoSound )
{
  MakeCapturing( Mode1556PsF15, 2 );
  const VReceivedFrame Frame = Next();
  EXPECT_EQ( Frame.m_Period, 0 );
  EXPECT_TRUE( Frame.m_Header.m_AudioInfo.IsEmpty() );
  EXPECT_EQ( m_Card.m_LastRecord.m_ChannelMask, 0u ) << "the decoder is to write nothing where there is no room";
}

TEST_F( Bluefish444Device, WhatCannotBeHadCostsOneFrame )
{
  MakeCapturing();
  const size_t Before = m_pReceiver->Count();
  m_pAllocator->m_bExhausted = true;
  m_Card.Resume();
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Memory allocation failed." } ) );
  m_pAllocator->m_bExhausted = false;
  m_Card.m_bReads = false;
  m_Card.Resume();
  EXPECT_TRUE( m_Log.Has( "Could not read a frame of Epoch Horizon C1:ChA from the card." ) );
  m_Card.m_bReads = true;
  EXPECT_EQ( m_pReceiver->Count(), Before );
  EXPECT_EQ( Next().m_Index, Before );
  m_pReceiver->m_bAccept = false;
  Next();
  EXPECT_EQ( m_pAllocator->m_Outstanding, 0 ) << "given back at once";
  m_pReceiver->m_bAccept = true;
  m_pReceiver.reset();
  m_Card.Resume();
  EXPECT_EQ( m_pAllocator->m_Outstanding, 0 ) << "nobody takes it";
  m_pReceiver = std::make_shared<VFrameReceiver>();
  m_pDevice->SetDataCallback( m_pReceiver );
  EXPECT_EQ( Next().m_Index, Before + 2 );
}

TEST_F( Bluefish444Device, FramesOfOneLabelLieAFrameApart )
{
  m_Card.m_Timecodes[Place::RP188LTC] = 0x01'00'00'00'00'00'00'00;
  MakeCapturing( Mode720p5994 );
  const TestSupport::VLogCapture Details( "VideoInputDeviceBluefish444", 6 );
  EXPECT_EQ( Next().m_Timecode.m_TickRemainder, 2252250u );
  EXPECT_TRUE( Details.Has( "Timecode=10:00:00:00, SubFrameCount=1, FramePeriod=2252250" ) );
  m_Card.m_Timecodes[Place::RP188LTC] = 0x01'00'00'00'00'00'04'02;   // drop-frame
  const VReceivedFrame Other = Next();
  EXPECT_EQ( KVZ::ToText( Other.m_Timecode ), "10:00:00;02" );
  EXPECT_TRUE( KVZ::IsSameReading( Other.m_Timecode, Other.m_Header.m_Timecode ) );
  EXPECT_TRUE( KVZ::IsSameReading( Other.m_Timecode, m_pDevice->GetTimecode() ) );
  EXPECT_EQ( Fired(), ( VFired{ { "timecode", 1 } } ) );
  m_Card.m_Timecodes.clear();
  EXPECT_FALSE( KVZ::IsValid( Next().m_Timecode ) ) << "a label that the decoder does not find is none, not midnight";
  EXPECT_EQ( Fired(), ( VFired{ { "timecode", 1 } } ) );
}

TEST( Bluefish444Timecode, AWordHoldsDigitsFlagsAndUserBits )
{
  KVZ::ITimecode Timecode;
  //                          hours       minutes     seconds     frames; user bits 8 to 1 in the high nibbles
  constexpr uint64_t Word = 0x82'73'65'59'45'36'26'14;
  ASSERT_TRUE( ToTimecode( Word, 4504500, Timecode ) );
  EXPECT_EQ( KVZ::ToText( Timecode ), "23:59:56;24" );
  EXPECT_EQ( Timecode.m_UserBits, 0x87654321u );
  EXPECT_EQ( Timecode.m_SubFramePeriod, 4504500u );
  // Flags beside the tens count for nothing else: field mark, colour frame, binary groups
  EXPECT_TRUE( ToTimecode( Word | 0x0C'00'08'00'08'00'08'00, 4504500, Timecode ) );
  EXPECT_EQ( KVZ::ToText( Timecode ), "23:59:56;24" );
  EXPECT_FALSE( ToTimecode( NoTimecodeWord, 4504500, Timecode ) );
  EXPECT_FALSE( ToTimecode( 0x02'04'00'00'00'00'00'00, 5400000, Timecode ) ) << "24 hours";
  EXPECT_FALSE( ToTimecode( 0x00'00'00'00'00'00'02'05, 5400000, Timecode ) ) << "frame 25 of 25";
}

TEST( Bluefish444Timecode, EachSourceTriesItsPlacesInTurn )
{
  constexpr uint64_t Second = 0x1'0000;
  const struct
  {
    ITimecodeSource::Enum m_Source;
    std::vector<int> m_Seconds;   // read with all three there, then without LTC, then without VITC too; -1 for none
  } Cases[] = { { ITimecodeSource::ERP188_LTC, { 1, -1, -1 } }, { ITimecodeSource::ERP188_VITC1, { 2, 2, -1 } },
    { ITimecodeSource::EExternal_LTC, { 3, 3, 3 } }, { ITimecodeSource::ERP188_Any, { 1, 2, -1 } }, { ITimecodeSource::EAny, { 1, 2, 3 } },
    { ITimecodeSource::EUnspecified, { -1, -1, -1 } }, { ITimecodeSource::ESerial, { -1, -1, -1 } } };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( KVZ::ToName( rCase.m_Source ) );
    BlueVelvet::VHancDecodeRecord Record;
    Record.m_Timecodes[Place::RP188LTC] = Second;
    Record.m_Timecodes[Place::RP188VITC] = 2 * Second;
    Record.m_Timecodes[Place::ExternalLTC] = 3 * Second;
    std::vector<int> Seconds;
    for( const uint32_t Gone : { Place::RP188LTC, Place::RP188VITC, Place::SDVITC } )
    {
      const KVZ::ITimecode Timecode = ReadTimecode( Record, rCase.m_Source, 5400000 );
      Seconds.push_back( KVZ::IsValid( Timecode ) ? Timecode.m_Seconds : -1 );
      Record.m_Timecodes[Gone] = NoTimecodeWord;
    }
    EXPECT_EQ( Seconds, rCase.m_Seconds );
  }
}

TEST( Bluefish444Tables, MasksLeaveTheAnalogueChannelsOut )
{
  EXPECT_EQ( ChannelMask( 0 ), 0u );
  EXPECT_EQ( ChannelMask( 1 ), 0x1u );
  EXPECT_EQ( ChannelMask( 8 ), 0xFFu );
  EXPECT_EQ( ChannelMask( 16 ), 0x3FCFFu );
  EXPECT_EQ( ChannelMask( 40 ), 0x3FCFFu );
}

TEST( Bluefish444Tables, NumbersBeyondATableAreNotFollowed )
{
  TestSupport::VLogCapture Log( "VideoInputDeviceBluefish444", 2 );
  EXPECT_EQ( CardName( -1 ), "Unknown card" );
  EXPECT_EQ( CardName( 37 ), "Invalid card" );
  EXPECT_EQ( CardName( 38 ), "Unknown card" );
  EXPECT_EQ( StandardOfMode( 32 ), KVZ::IVideoStandard::ESD_720_576I_5000 );
  EXPECT_EQ( StandardOfMode( 45 ), KVZ::IVideoStandard::ESD_720_576I_5000 );
  EXPECT_EQ( StandardOfMode( 43 ), KVZ::IVideoStandard::EHD_2048_1080P_4800 );
  EXPECT_EQ( Log.Texts(), ( VCalls{ "Unsupported video standard.", "Invalid video standard." } ) );
  EXPECT_EQ( SamplesPerFrame( 0 ), 0u );
}

}
