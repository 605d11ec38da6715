#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/DeckLinkFixture.h"

namespace
{

using namespace DeckLinkAPI;
using KVZ::ITimecodeSource;
using KVZ::ITimecodeStandard;

Fake::VFrameContent Labelled( int64_t i_Duration, const Fake::VTimecodeContent& i_rTimecode, uint32_t i_Format = TimecodeFormat::RP188Any )
{
  Fake::VFrameContent Frame;
  Frame.m_Duration = i_Duration;
  Frame.m_Timecodes[i_Format] = i_rTimecode;
  return Frame;
}

TEST_F( DeckLinkDevice, TheFramePeriodChoosesTheTimecodeStandard )
{
  const struct
  {
    int64_t m_Duration;
    uint32_t m_Flags;
    ITimecodeStandard::Enum m_Standard;
  } Rows[] = {
    { 0, 0, ITimecodeStandard::ETimecode30 },
    { 4500000, 0, ITimecodeStandard::ETimecode30 },                         // 30
    { 2250000, TimecodeFlag::DropFrame, ITimecodeStandard::ETimecode30 },   // 60: drop-frame has no meaning here
    { 4504500, 0, ITimecodeStandard::ETimecode30Drift },                    // 29.97
    { 4504500, TimecodeFlag::DropFrame, ITimecodeStandard::ETimecode30Drop },
    { 2252250, TimecodeFlag::FieldMark, ITimecodeStandard::ETimecode30Drift },   // 59.94
    { 2252250, TimecodeFlag::DropFrame | TimecodeFlag::FieldMark, ITimecodeStandard::ETimecode30Drop },
    { 5400000, 0, ITimecodeStandard::ETimecode25 },        // 25
    { 2700000, 0, ITimecodeStandard::ETimecode25 },        // 50
    { 5625000, 0, ITimecodeStandard::ETimecode24 },        // 24
    { 2812500, 0, ITimecodeStandard::ETimecode24 },        // 48
    { 5630625, 0, ITimecodeStandard::ETimecode24Drift },   // 23.98
    { 1234567, 0, ITimecodeStandard::ETimecode30 },
  };
  InitialiseAndCapture();
  for( uint8_t Hours = 10; const auto& rRow : Rows )
  {
    SCOPED_TRACE( rRow.m_Duration );
    const std::string Hour = std::to_string( Hours );
    const VReceivedFrame Frame = Delivered( Labelled( rRow.m_Duration, { Hours++, 20, 30, 12, rRow.m_Flags, 0xCAFE } ) );
    EXPECT_EQ( Frame.m_Timecode.m_Standard, rRow.m_Standard );
    EXPECT_EQ( Frame.m_Timecode.m_SubFramePeriod, rRow.m_Duration );
    EXPECT_EQ( Frame.m_Timecode.m_UserBits, 0xCAFEu );
    EXPECT_EQ( KVZ::ToText( Frame.m_Timecode ), rRow.m_Standard == ITimecodeStandard::ETimecode30Drop ? Hour + ":20:30;12" : Hour + ":20:30:12" );
    EXPECT_EQ( Frame.m_Period, rRow.m_Duration );
    EXPECT_TRUE( KVZ::IsSameReading( Frame.m_Timecode, Frame.m_Header.m_Timecode ) );
  }

  Fake::VFrameContent Untimed = Labelled( 5400000, {} );
  Untimed.m_Failures = { "GetStreamTime" };
  const VReceivedFrame Frame = Delivered( Untimed );
  EXPECT_EQ( Frame.m_Timecode.m_Standard, ITimecodeStandard::ETimecodeNone );
  EXPECT_EQ( Frame.m_Period, 0 );
}

// Every format carries its own hour, so that a reading tells where it came from.
TEST_F( DeckLinkDevice, TheSourceChoosesTheVendorsTimecode )
{
  constexpr uint32_t Formats[] = { TimecodeFormat::RP188Any, TimecodeFormat::VITCField1, TimecodeFormat::VITCField2, TimecodeFormat::Serial,
    TimecodeFormat::RP188LTC, TimecodeFormat::RP188VITC1, TimecodeFormat::RP188VITC2 };
  const struct
  {
    ITimecodeSource::Enum m_Source;
    size_t m_Absent;   // so many of the formats, from the first one on
    int m_Hours;       // the format's position; -1 for no timecode
  } Rows[] = {
    { ITimecodeSource::ERP188_Any, 0, 0 },
    { ITimecodeSource::EVITC_Field1, 0, 1 },
    { ITimecodeSource::EVITC_Field2, 0, 2 },
    { ITimecodeSource::ESerial, 0, 3 },
    { ITimecodeSource::ERP188_LTC, 0, 4 },
    { ITimecodeSource::ERP188_VITC1, 0, 5 },
    { ITimecodeSource::ERP188_VITC2, 0, 6 },
    { ITimecodeSource::EExternal_LTC, 0, -1 },
    { ITimecodeSource::EUnspecified, 0, -1 },
    { ITimecodeSource::ERP188_Any, 1, -1 },
    { ITimecodeSource::EAny, 0, 0 },
    { ITimecodeSource::EAny, 1, 1 },
    { ITimecodeSource::EAny, 2, 2 },
    { ITimecodeSource::EAny, 3, 3 },
  };
  Initialise();
  for( const auto& rRow : Rows )
  {
    SCOPED_TRACE( KVZ::ToName( rRow.m_Source ) + " without " + std::to_string( rRow.m_Absent ) );
    Fake::VFrameContent Frame;
    for( size_t Hours = rRow.m_Absent; Hours < std::size( Formats ); ++Hours )
    {
      Frame.m_Timecodes[Formats[Hours]] = { static_cast<uint8_t>( Hours ), 0, 0, 0 };
    }
    ASSERT_TRUE( m_pDevice->StartCapture( UYVY, rRow.m_Source, Int16, 0 ).Succeeded() );
    const KVZ::ITimecode Timecode = Delivered( Frame ).m_Timecode;
    EXPECT_EQ( KVZ::IsValid( Timecode ) ? Timecode.m_Hours : -1, rRow.m_Hours );
  }
}

// Two frames a label at 50, 59.94 and 60: the second lies one frame period into its label.
TEST_F( DeckLinkDevice, RepeatedLabelsAreToldApartByTheirTicks )
{
  InitialiseAndCapture();
  for( const int64_t Duration : { 2700000, 2252250, 2250000 } )
  {
    SCOPED_TRACE( Duration );
    for( uint8_t Label = 5; Label < 8; ++Label )
    {
      const KVZ::ITimecode First = Delivered( Labelled( Duration, { 1, 2, 3, Label } ) ).m_Timecode;
      const KVZ::ITimecode Second = Delivered( Labelled( Duration, { 1, 2, 3, Label, TimecodeFlag::FieldMark } ) ).m_Timecode;
      EXPECT_EQ( First.m_Frames, Label );
      EXPECT_EQ( First.m_TickRemainder, 0u );
      EXPECT_EQ( Second.m_Frames, Label );
      EXPECT_EQ( Second.m_TickRemainder, Duration );
    }
    // What the device shows is the label as it was read.
    EXPECT_EQ( m_pDevice->GetTimecode().m_TickRemainder, 0u );
  }
}

TEST_F( DeckLinkDevice, ALabelThatStandsStillRunsOnByTheVideosPeriod )
{
  InitialiseAndCapture();
  const auto Frozen = Labelled( 5400000, { 1, 0, 0, 24 } );
  EXPECT_EQ( KVZ::ToText( Delivered( Frozen ).m_Timecode ), "01:00:00:24" );
  EXPECT_EQ( KVZ::ToText( Delivered( Frozen ).m_Timecode ), "01:00:01:00" );
  EXPECT_EQ( KVZ::ToText( Delivered( Frozen ).m_Timecode ), "01:00:01:01" );
  auto OtherUserBits = Frozen;
  OtherUserBits.m_Timecodes[TimecodeFormat::RP188Any].m_UserBits = 1;
  EXPECT_EQ( KVZ::ToText( Delivered( OtherUserBits ).m_Timecode ), "01:00:00:24" );
}

TEST_F( DeckLinkDevice, OnlyAnotherStandardAndALossAreAnnounced )
{
  InitialiseAndCapture();
  Delivered( Labelled( 5400000, { 1, 0, 0, 0 } ) );
  EXPECT_EQ( Fired()["timecode"], 1 );
  Delivered( Labelled( 5400000, { 1, 0, 0, 1 } ) );
  Delivered( Labelled( 5400000, { 9, 0, 0, 0 } ) );
  EXPECT_EQ( Fired(), VFired() );
  EXPECT_EQ( KVZ::ToText( m_pDevice->GetTimecode() ), "09:00:00:00" );

  // The signal stays, its timecode goes
  Delivered( {} );
  EXPECT_EQ( Fired(), ( VFired{ { "timecode", 1 } } ) );
  Delivered( {} );
  EXPECT_EQ( Fired(), VFired() );

  Delivered( Labelled( 4504500, { 1, 0, 0, 2, TimecodeFlag::DropFrame } ) );
  EXPECT_EQ( Fired(), ( VFired{ { "timecode", 1 } } ) );
  Input().DeliverFrame( { .m_Flags = FrameFlag::NoInputSource } );
  EXPECT_EQ( Fired(), ( VFired{ { "standard", 1 }, { "formats", 1 }, { "timecode", 1 } } ) );
  EXPECT_EQ( m_pDevice->GetTimecode().m_Standard, ITimecodeStandard::ETimecodeNone );

  // The same label after the gap begins anew.
  EXPECT_EQ( Delivered( Labelled( 4504500, { 1, 0, 0, 2, TimecodeFlag::DropFrame } ) ).m_Timecode.m_TickRemainder, 0u );
}

}
