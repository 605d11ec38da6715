// What a client finds out about virtual Bluefish444 cards, and how they refuse.
#include "tests/cards/BluefishClient.h"

#include <array>

using namespace BluefishTests;

namespace
{

class BluefishCard : public VBluefishFixture
{
};

}

TEST_F( BluefishCard, CardsAreCountedAsTheyComeAndGo )
{
  EXPECT_EQ( m_Object.Count(), 0 );
  EXPECT_FALSE( m_Object.Attach( 1 ) );
  Plug( "bluefish444" );
  EXPECT_EQ( m_Object.Count(), 1 );
  EXPECT_FALSE( m_Object.Attach( 1 ) ) << "it is attached already";
  VObject Other;
  EXPECT_FALSE( Other.Attach( 0 ) );
  EXPECT_FALSE( Other.Attach( 2 ) );
  EXPECT_FALSE( Other.Query( Property::InvalidVideoModeFlag ) ) << "not attached";
  ASSERT_TRUE( Control().SetBusy( m_Card, true ) );
  EXPECT_FALSE( Other.Attach( 1 ) ) << "another program has it";
  ASSERT_TRUE( Control().SetBusy( m_Card, false ) );
  EXPECT_TRUE( Other.Attach( 1 ) ) << "several objects may share a card";

  Event( R"({"do": "remove"})" );
  Step();
  EXPECT_EQ( m_Object.Count(), 0 );
  EXPECT_FALSE( m_Object.Query( Property::InvalidVideoModeFlag ) );
  Event( R"({"do": "arrive"})" );
  Step();
  EXPECT_EQ( m_Object.Count(), 1 );
  EXPECT_TRUE( m_Object.Query( Property::InvalidVideoModeFlag ) );
}

TEST_F( BluefishCard, TellsItsFeatures )
{
  const struct
  {
    const char* m_pText;
    std::optional<uint32_t> m_Features;   // of streams and of connectors
    uint32_t m_Product;
    uint32_t m_Devices;
  } Cases[] = { { "bluefish444:inputs=3,outputs=1", 0x31, 0x0B, 3 }, { "bluefish444:inputs=0,outputs=2", 0x02, 0x02, 0 },
    { "bluefish444:driver=old", std::nullopt, 0x02, 0 } };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.m_pText );
    AddCard( rCase.m_pText );
    VObject Object;
    ASSERT_TRUE( Object.Attach( 1 ) );
    EXPECT_EQ( Object.Query( Property::CardFeatureStreamInfo ), rCase.m_Features );
    EXPECT_EQ( Object.Query( Property::CardFeatureConnectorInfo ), rCase.m_Features );
    EXPECT_EQ( Object.Query( Property::ProductId ), rCase.m_Product );
    EXPECT_EQ( Control().CountDevices( m_Card ), rCase.m_Devices );
    ASSERT_TRUE( Control().RemoveCard( m_Card ) );
  }
}

TEST_F( BluefishCard, HasTheInputsThatItWasGivenAndNoOthers )
{
  Plug( "bluefish444:inputs=3" );
  EXPECT_EQ( m_Object.Query( Property::InvalidVideoModeFlag ), NoSignal );
  int Type = 0;
  EXPECT_EQ( Functions().bfcQueryCardType( m_Object.m_Handle, &Type, 0 ), 0 );
  EXPECT_EQ( Type, 33 );
  EXPECT_TRUE( m_Object.Set( Property::DefaultVideoInputChannel, 4 ) );
  EXPECT_EQ( m_Object.Query( Property::DefaultVideoInputChannel ), 4u );
  EXPECT_FALSE( m_Object.Set( Property::DefaultVideoInputChannel, 5 ) ) << "the fourth input";
}

TEST_F( BluefishCard, ObjectsAreCounted )
{
  const VHandle Handle = Functions().bfcFactory();
  EXPECT_EQ( Control().ReferencesHeld(), 2 );
  Functions().bfcDestroy( Handle );
  EXPECT_EQ( Control().ReferencesHeld(), 1 );
  Functions().bfcDestroy( Handle );
  EXPECT_EQ( Control().ReleaseErrors(), m_ErrorsBefore + 1 ) << "freed twice";
  int Count = 0;
  EXPECT_NE( Functions().bfcEnumerate( Handle, &Count ), 0 );

  Plug( "bluefish444" );
  const VHandle Attached = Functions().bfcFactory();
  ASSERT_EQ( Functions().bfcAttach( Attached, 1 ), 0 );
  Functions().bfcDestroy( Attached );
  EXPECT_EQ( Control().ReleaseErrors(), m_ErrorsBefore + 2 ) << "freed while attached";
  const_cast<int64_t&>( m_ErrorsBefore ) += 2;
}

TEST_F( BluefishCard, SizesOfBothGenerationsAgree )
{
  const struct
  {
    uint32_t m_Mode;
    uint32_t m_Memory;
    uint32_t m_Width;
    uint32_t m_Lines;
    uint32_t m_LineBytes;
  } Cases[] = { { 0, MemoryFormat::TwoVUY, 720, 576, 1440 }, { 3, MemoryFormat::V210, 1280, 720, 3456 },
    { 36, MemoryFormat::RGB, 2048, 1080, 6144 } };
  for( const auto& [Mode, Memory, Width, Lines, LineBytes] : Cases )
  {
    SCOPED_TRACE( Mode );
    const uint32_t Golden = ( LineBytes * Lines + 4095 ) / 4096 * 4096;
    std::array<uint32_t, 5> Sizes{};
    auto& [rWidth, rLines, rLineBytes, rBytes, rGolden] = Sizes;
    Functions().bfcGetVideoInfo( static_cast<int>( Mode ), 1, static_cast<int>( Memory ), &rWidth, &rLines, &rLineBytes, &rBytes, &rGolden );
    EXPECT_EQ( Sizes, ( std::array{ Width, Lines, LineBytes, LineBytes * Lines, Golden } ) );
    EXPECT_EQ( Functions().bfcGetPixelsPerLine( Mode ), Width );
    EXPECT_EQ( Functions().bfcGetLinesPerFrame( Mode, UpdateMethod::Frame ), Lines );
    EXPECT_EQ( Functions().bfcGetBytesPerLine( Mode, Memory ), LineBytes );
    EXPECT_EQ( Functions().bfcGetGoldenValue( Mode, Memory, UpdateMethod::Frame ), Golden );
  }
  EXPECT_EQ( Functions().bfcGetLinesPerFrame( 8, UpdateMethod::Field ), 540u );
  EXPECT_EQ( Functions().bfcGetLinesPerFrame( NoSignal, UpdateMethod::Frame ), 0u );
}
