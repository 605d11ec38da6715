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

class DeckLinkDiscovery : public testing::Test
{
protected:
  VCardId Add()
  {
    std::string Error;
    m_Cards.push_back( DeckLinkControl().AddCard( "decklink", { true }, Error ) );
    EXPECT_NE( m_Cards.back(), 0u ) << Error;
    return m_Cards.back();
  }

  std::string NameOf( VCardId i_Card ) { return "+DeckLink Virtual (" + std::to_string( i_Card ) + ")"; }

  void TearDown() override
  {
    for( const VCardId Card : m_Cards )
    {
      DeckLinkControl().RemoveCard( Card );
    }
    EXPECT_EQ( DeckLinkControl().ReferencesHeld(), 0 );
    EXPECT_EQ( m_Watcher.m_References, 1 );
  }

  VWatcher m_Watcher;
  std::vector<VCardId> m_Cards;
};

}

TEST_F( DeckLinkDiscovery, ReportsCardsThatAreThereAndThoseThatComeLater )
{
  const VCardId First = Add();
  const VPointer<IDeckLinkDiscovery> pDiscovery = MakeDiscovery();
  EXPECT_EQ( pDiscovery->InstallDeviceNotifications( &m_Watcher ), S_OK );
  EXPECT_EQ( m_Watcher.m_News, std::vector<std::string>( { NameOf( First ) } ) );
  EXPECT_EQ( pDiscovery->InstallDeviceNotifications( &m_Watcher ), E_ACCESSDENIED );

  const VCardId Second = Add();
  EXPECT_EQ( m_Watcher.m_News.back(), NameOf( Second ) );
  EXPECT_TRUE( DeckLinkControl().RemoveCard( First ) );
  EXPECT_EQ( m_Watcher.m_News.back(), "-1" ) << "the same pointer that arrived";
  EXPECT_FALSE( DeckLinkControl().RemoveCard( First ) );

  EXPECT_EQ( pDiscovery->UninstallDeviceNotifications(), S_OK );
  EXPECT_EQ( pDiscovery->UninstallDeviceNotifications(), S_FALSE );
  Add();
  EXPECT_EQ( m_Watcher.m_News.size(), 3u );
}

TEST_F( DeckLinkDiscovery, ACardThatWasTakenOutComesBackAsANewOne )
{
  VClient Client;
  VPointer<IDeckLinkInput> pInput;
  const auto Stream = [&]
  {
    pInput->SetCallback( &Client );
    pInput->EnableVideoInput( Mode1080p25, PixelFormat::YUV8Bit, 0 );
    pInput->StartStreams();
  };
  std::string Error;
  const VPointer<IDeckLinkDiscovery> pDiscovery = MakeDiscovery();
  pDiscovery->InstallDeviceNotifications( &m_Watcher );
  m_Watcher.m_OnArrival = [&]( IDeckLink* i_pCard ) { pInput = Query<IDeckLinkInput>( *i_pCard, IID_IDeckLinkInput ); };
  const VCardId Card = Add();
  Stream();
  EXPECT_TRUE( DeckLinkControl().Step( Card, 3 ) );
  const VPointer<IDeckLinkInput> pFirst = std::move( pInput );
  EXPECT_TRUE( DeckLinkControl().RunEvent( Card, R"({ "do": "remove" })", Error ) ) << Error;
  EXPECT_TRUE( DeckLinkControl().Step( Card, 2 ) );
  EXPECT_EQ( Client.m_FrameCalls, 3 );
  EXPECT_EQ( m_Watcher.m_News.size(), 2u );
  EXPECT_EQ( pFirst->StartStreams(), E_FAIL );
  EXPECT_EQ( pFirst->EnableVideoInput( Mode1080p25, PixelFormat::YUV8Bit, 0 ), E_FAIL );

  EXPECT_TRUE( DeckLinkControl().RunEvent( Card, R"({ "do": "arrive" })", Error ) ) << Error;
  EXPECT_TRUE( DeckLinkControl().Step( Card, 1 ) );
  ASSERT_NE( pInput, nullptr );
  EXPECT_NE( pInput.get(), pFirst.get() );
  EXPECT_EQ( m_Watcher.m_News.size(), 3u );
  Stream();
  EXPECT_TRUE( DeckLinkControl().Step( Card, 2 ) );
  EXPECT_EQ( Client.m_FrameCalls, 5 );
  pInput->SetCallback( nullptr );
  pFirst->SetCallback( nullptr );
}

TEST_F( DeckLinkDiscovery, AnArrivalMayUninstallOrAddMore )
{
  VPointer<IDeckLinkDiscovery> pDiscovery = MakeDiscovery();
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
    const VPointer<IDeckLinkDiscovery> pDiscovery( Exported<IDeckLinkDiscovery*()>( pName )() );
    pDiscovery->InstallDeviceNotifications( &m_Watcher );
  }
  EXPECT_EQ( m_Watcher.m_News.size(), 3u * 2 );
  for( const char* pName : { "CreateDeckLinkIteratorInstance_0002", "CreateDeckLinkIteratorInstance_0003", "CreateDeckLinkIteratorInstance_0004" } )
  {
    const VPointer<IDeckLinkIterator> pIterator( Exported<IDeckLinkIterator*()>( pName )() );
    int Count = 0;
    for( IDeckLink* pCard = nullptr; pIterator->Next( &pCard ) == S_OK; pCard->Release() )
    {
      ++Count;
    }
    EXPECT_EQ( Count, 2 );
  }
}
