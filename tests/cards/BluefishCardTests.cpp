// What a client finds out about virtual Bluefish444 cards, and how they refuse.
#include "tests/cards/BluefishClient.h"

using namespace BluefishTests;
using BluefishCard = VBluefishFixture;

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
    uint32_t m_Inputs;
    uint32_t m_Devices;
  } Cases[] = { { "bluefish444:inputs=3,outputs=1", 0x31, 0x0B, 3, 3 }, { "bluefish444:inputs=0,outputs=2", 0x02, 0x02, 0, 0 },
    { "bluefish444:driver=old", std::nullopt, 0x02, 1, 0 } };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.m_pText );
    AddCard( rCase.m_pText );
    VObject Object;
    ASSERT_TRUE( Object.Attach( 1 ) );
    EXPECT_EQ( Object.Query( Property::CardFeatureStreamInfo ), rCase.m_Features );
    EXPECT_EQ( Object.Query( Property::CardFeatureConnectorInfo ), rCase.m_Features );
    EXPECT_EQ( Object.Query( Property::ProductId ), rCase.m_Product );
    EXPECT_EQ( Object.Query( Property::InvalidVideoModeFlag ), NoSignal );
    EXPECT_EQ( Control().CountDevices( m_Card ), rCase.m_Devices );
    for( uint32_t Input = 0; Input < 4; ++Input )
    {
      EXPECT_EQ( Object.Set( Property::DefaultVideoInputChannel, InputChannelA + Input ), Input < rCase.m_Inputs ) << Input;
    }
    ASSERT_TRUE( Control().RemoveCard( m_Card ) );
  }
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
