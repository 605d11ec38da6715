// Cards that come and go.
#include "tests/cards/DeckLinkClient.h"

using namespace CardsTests;

namespace
{

class VWatcher final : public VCallbackObject<IDeckLinkDeviceNotificationCallback>
{
public:
  HRESULT DeckLinkDeviceArrived( IDeckLink* i_pCard ) override
  {
    const char* pName = nullptr;
    EXPECT_EQ( i_pCard->GetDisplayName( &pName ), S_OK );
    m_News.push_back( "+" + TakeText( pName ) );
    m_Arrived.push_back( i_pCard );
    if( m_OnArrival )
    {
      m_OnArrival( i_pCard );
    }
    return S_OK;
  }

  HRESULT DeckLinkDeviceRemoved( IDeckLink* i_pCard ) override
  {
    m_News.push_back( "-" + std::to_string( std::count( m_Arrived.begin(), m_Arrived.end(), i_pCard ) ) );
    return S_OK;
  }

  std::function<void( IDeckLink* )> m_OnArrival;
  std::vector<std::string> m_News;
  std::vector<IDeckLink*> m_Arrived;
};

class DeckLinkDiscovery : public VCardsFixture
{
protected:
  DeckLinkDiscovery() : VCardsFixture( DeckLinkControl() ) {}

  std::string Add()
  {
    AddCard( "decklink" );
    return "+DeckLink Virtual (" + std::to_string( m_Card ) + ")";
  }

  void TearDown() override
  {
    RemoveCards();
    EXPECT_EQ( Control().ReferencesHeld(), 0 );
    EXPECT_EQ( m_Watcher.m_References, 1 );
  }

  VWatcher m_Watcher;
};

}

TEST_F( DeckLinkDiscovery, ReportsCardsThatAreThereAndThoseThatComeLater )
{
  const std::string First = Add();
  const VCardId FirstCard = m_Card;
  const VComPointer<IDeckLinkDiscovery> pDiscovery = MakeDiscovery();
  EXPECT_EQ( pDiscovery->InstallDeviceNotifications( &m_Watcher ), S_OK );
  EXPECT_EQ( m_Watcher.m_News, std::vector<std::string>( { First } ) );
  EXPECT_EQ( pDiscovery->InstallDeviceNotifications( &m_Watcher ), E_ACCESSDENIED );

  const std::string Second = Add();
  EXPECT_EQ( m_Watcher.m_News.back(), Second );
  EXPECT_TRUE( Control().RemoveCard( FirstCard ) );
  EXPECT_EQ( m_Watcher.m_News.back(), "-1" ) << "the same pointer that arrived";
  EXPECT_FALSE( Control().RemoveCard( FirstCard ) );

  EXPECT_EQ( pDiscovery->UninstallDeviceNotifications(), S_OK );
  EXPECT_EQ( pDiscovery->UninstallDeviceNotifications(), S_FALSE );
  Add();
  EXPECT_EQ( m_Watcher.m_News.size(), 3u );
}

TEST_F( DeckLinkDiscovery, ACardThatWasTakenOutComesBackAsANewOne )
{
  VClient Client;
  VComPointer<IDeckLinkInput> pInput;
  const auto Stream = [&]
  {
    pInput->SetCallback( &Client );
    pInput->EnableVideoInput( Mode1080p25, PixelFormat::YUV8Bit, 0 );
    pInput->StartStreams();
  };
  const VComPointer<IDeckLinkDiscovery> pDiscovery = MakeDiscovery();
  pDiscovery->InstallDeviceNotifications( &m_Watcher );
  m_Watcher.m_OnArrival = [&]( IDeckLink* i_pCard ) { pInput = QueryInterface<IDeckLinkInput>( *i_pCard, IID_IDeckLinkInput ); };
  Add();
  Stream();
  Step( 3 );
  const VComPointer<IDeckLinkInput> pFirst = std::move( pInput );
  Event( R"({ "do": "remove" })" );
  Step( 2 );
  EXPECT_EQ( Client.m_FrameCalls, 3 );
  EXPECT_EQ( m_Watcher.m_News.size(), 2u );
  EXPECT_EQ( pFirst->StartStreams(), E_FAIL );
  EXPECT_EQ( pFirst->EnableVideoInput( Mode1080p25, PixelFormat::YUV8Bit, 0 ), E_FAIL );

  Event( R"({ "do": "arrive" })" );
  Step( 1 );
  ASSERT_NE( pInput, nullptr );
  EXPECT_NE( pInput.get(), pFirst.get() );
  EXPECT_EQ( m_Watcher.m_News.size(), 3u );
  Stream();
  Step( 2 );
  EXPECT_EQ( Client.m_FrameCalls, 5 );
  pInput->SetCallback( nullptr );
  pFirst->SetCallback( nullptr );
}

TEST_F( DeckLinkDiscovery, AnArrivalMayUninstallOrAddMore )
{
  VComPointer<IDeckLinkDiscovery> pDiscovery = MakeDiscovery();
  m_Watcher.m_OnArrival = [&]( IDeckLink* )
  {
    if( m_Watcher.m_News.size() == 1 )
    {
      Add();   // told after this one
      EXPECT_EQ( m_Watcher.m_News.size(), 1u );
    }
    else
    {
      EXPECT_EQ( pDiscovery->UninstallDeviceNotifications(), S_OK );
    }
  };
  pDiscovery->InstallDeviceNotifications( &m_Watcher );
  Add();
  EXPECT_EQ( m_Watcher.m_News.size(), 2u );
  Add();
  EXPECT_EQ( m_Watcher.m_News.size(), 2u );
}

TEST_F( DeckLinkDiscovery, AllGenerationsOfTheFactoriesFindTheCards )
{
  Add();
  Add();
  for( const char* pName :
    { "CreateDeckLinkDiscoveryInstance_0001", "CreateDeckLinkDiscoveryInstance_0002", "CreateDeckLinkDiscoveryInstance_0003" } )
  {
    const auto pDiscovery = Make<IDeckLinkDiscovery>( pName );
    pDiscovery->InstallDeviceNotifications( &m_Watcher );
  }
  EXPECT_EQ( m_Watcher.m_News.size(), 3u * 2 );
  for( const char* pName : { "CreateDeckLinkIteratorInstance_0002", "CreateDeckLinkIteratorInstance_0003", "CreateDeckLinkIteratorInstance_0004" } )
  {
    const auto pIterator = Make<IDeckLinkIterator>( pName );
    int Count = 0;
    for( IDeckLink* pCard = nullptr; pIterator->Next( &pCard ) == S_OK; pCard->Release() )
    {
      ++Count;
    }
    EXPECT_EQ( Count, 2 );
  }
}
