// What a client finds out about virtual Bluefish444 cards, and how they refuse.
#include "tests/cards/BluefishClient.h"

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
  Plug( "bluefish444:inputs=3,outputs=1" );
  EXPECT_EQ( m_Object.Query( Property::CardFeatureStreamInfo ), 0x31u );
  EXPECT_EQ( m_Object.Query( Property::CardFeatureConnectorInfo ), 0x31u );
  EXPECT_EQ( m_Object.Query( Property::ProductId ), 0x0Bu );
  EXPECT_EQ( m_Object.Query( Property::InvalidVideoModeFlag ), NoSignal );
  int Type = 0;
  EXPECT_EQ( Functions().bfcQueryCardType( m_Object.m_Handle, &Type, 0 ), 0 );
  EXPECT_EQ( Type, 33 );
  EXPECT_EQ( Control().CountDevices( m_Card ), 3u );
  EXPECT_TRUE( m_Object.Set( Property::DefaultVideoInputChannel, 4 ) );
  EXPECT_EQ( m_Object.Query( Property::DefaultVideoInputChannel ), 4u );
  EXPECT_FALSE( m_Object.Set( Property::DefaultVideoInputChannel, 5 ) ) << "the fourth input";
}

TEST_F( BluefishCard, AnOldDriverDoesNotTellFeatures )
{
  Plug( "bluefish444:driver=old" );
  EXPECT_FALSE( m_Object.Query( Property::CardFeatureStreamInfo ) );
  EXPECT_FALSE( m_Object.Query( Property::CardFeatureConnectorInfo ) );
  EXPECT_TRUE( m_Object.Query( Property::ProductId ) );
  EXPECT_EQ( Control().CountDevices( m_Card ), 0u );
}

TEST_F( BluefishCard, RefusesOtherKinds )
{
  std::string Error;
  EXPECT_EQ( Control().AddCard( "decklink", { true }, Error ), 0u );
  EXPECT_NE( Error.find( "accepted: bluefish444" ), std::string::npos );
}

TEST_F( BluefishCard, ACardOfOutputsHasNoInputToUse )
{
  Plug( "bluefish444:inputs=0,outputs=2" );
  EXPECT_EQ( m_Object.Query( Property::CardFeatureStreamInfo ), 0x02u );
  EXPECT_FALSE( m_Object.Query( Property::VideoInputSignalVideoMode ) );
  EXPECT_FALSE( m_Object.Wait() );
  EXPECT_EQ( Control().CountDevices( m_Card ), 0u );
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
  const auto Equal = []( uint32_t i_Mode, uint32_t i_Memory )
  {
    uint32_t Width = 0;
    uint32_t Lines = 0;
    uint32_t LineBytes = 0;
    uint32_t Bytes = 0;
    uint32_t Golden = 0;
    EXPECT_EQ(
      Functions().bfcGetVideoInfo( static_cast<int>( i_Mode ), 1, static_cast<int>( i_Memory ), &Width, &Lines, &LineBytes, &Bytes, &Golden ), 0 );
    EXPECT_EQ( Functions().bfcGetPixelsPerLine( i_Mode ), Width );
    EXPECT_EQ( Functions().bfcGetLinesPerFrame( i_Mode, 1 ), Lines );
    EXPECT_EQ( Functions().bfcGetBytesPerLine( i_Mode, i_Memory ), LineBytes );
    EXPECT_EQ( Functions().bfcGetGoldenValue( i_Mode, i_Memory, 1 ), Golden );
    EXPECT_EQ( Bytes, LineBytes * Lines );
    EXPECT_TRUE( Golden >= Bytes && Golden < Bytes + 4096 && Golden % 4096 == 0 );
    return std::vector<uint32_t>{ Width, Lines, LineBytes };
  };
  EXPECT_EQ( Equal( 0, MemoryFormat::TwoVUY ), ( std::vector<uint32_t>{ 720, 576, 1440 } ) );
  EXPECT_EQ( Equal( 3, MemoryFormat::V210 ), ( std::vector<uint32_t>{ 1280, 720, 3456 } ) );
  EXPECT_EQ( Equal( 36, MemoryFormat::RGB ), ( std::vector<uint32_t>{ 2048, 1080, 6144 } ) );
  EXPECT_EQ( Functions().bfcGetLinesPerFrame( 8, UpdateMethod::Field ), 540u );
  EXPECT_EQ( Functions().bfcGetLinesPerFrame( NoSignal, UpdateMethod::Frame ), 0u );
}
