#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDriver.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/ComPointer.h"
#include "tests/support/FakeDeckLink.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <memory>
#include <vector>

namespace
{

namespace Fake = TestSupport::FakeDeckLink;
using namespace DeckLinkAPI;
using VideoInputHAL::IVideoInputDevice;
using VideoInputHAL::VBlackmagicDeckLinkDriver;
using VideoInputHAL::VComPointer;

class DeckLinkDriver : public ::testing::Test
{
protected:
  const int m_LiveBefore = Fake::Live();
  VComPointer<Fake::VDiscovery> m_pDiscovery{ new Fake::VDiscovery, false };
  VComPointer<Fake::VCard> m_pCard{ new Fake::VCard, false };
  VComPointer<Fake::VCard> m_pOtherCard{ new Fake::VCard, false };
  std::shared_ptr<TestSupport::VManualPostalService> m_pService = std::make_shared<TestSupport::VManualPostalService>();
  std::vector<std::shared_ptr<IVideoInputDevice>> m_Arrived;
  std::shared_ptr<VBlackmagicDeckLinkDriver> m_pDriver = KVZ::MakeShared<VBlackmagicDeckLinkDriver>(
    [this] { return VComPointer<Fake::VDiscovery>( m_pDiscovery ).detach(); } );

  void SetUp() override
  {
    m_pDriver->GetDeviceArrivedCallback().Add( [this]( const std::shared_ptr<IVideoInputDevice>& i_pDevice ) { m_Arrived.push_back( i_pDevice ); },
      m_pService );
  }
  void TearDown() override
  {
    m_pDriver.reset();
    m_Arrived.clear();
    m_pService.reset();
    m_pDiscovery.reset();
    m_pCard.reset();
    m_pOtherCard.reset();
    EXPECT_EQ( Fake::Live(), m_LiveBefore );
  }
  std::vector<std::string> Names()
  {
    m_pService->RunAll();
    std::vector<std::string> Names;
    for( const auto& pDevice : m_Arrived )
    {
      Names.push_back( pDevice->GetDeviceName() );
    }
    return Names;
  }
};

using VNames = std::vector<std::string>;

TEST_F( DeckLinkDriver, AnnouncesCardsByNumberOnceDiscoveryRuns )
{
  m_pDiscovery->Arrive( *m_pCard );
  EXPECT_EQ( Names(), VNames{} );
  m_pDriver->StartDiscovery();
  m_pDiscovery->Arrive( *m_pCard );
  EXPECT_TRUE( m_Arrived.empty() );   // through a postal service, never on the vendor's thread
  m_pDiscovery->Arrive( *m_pOtherCard );
  EXPECT_EQ( Names(), ( VNames{ "DeckLink C1", "DeckLink C2" } ) );
  EXPECT_TRUE( m_pCard->Input().IsRunning() );
}

TEST_F( DeckLinkDriver, ACardThatFailsIsNotAnnouncedAndKeepsItsNumber )
{
  m_pDriver->StartDiscovery();
  m_pCard->Input().m_Failures = { "EnableVideoInput" };
  m_pDiscovery->Arrive( *m_pCard );
  m_pDiscovery->Arrive( *m_pOtherCard );
  EXPECT_EQ( Names(), ( VNames{ "DeckLink C2" } ) );
  EXPECT_EQ( m_pCard->References(), 1u );
  EXPECT_EQ( m_pCard->Input().Callback(), nullptr );
}

TEST_F( DeckLinkDriver, ForgetsARemovedCardAndNumbersItAnewWhenItComesBack )
{
  m_pDriver->StartDiscovery();
  m_pDiscovery->Arrive( *m_pCard );
  m_pDiscovery->Remove( *m_pCard );
  m_pDiscovery->Remove( *m_pOtherCard );   // never arrived
  ASSERT_EQ( Names(), ( VNames{ "DeckLink C1" } ) );
  EXPECT_EQ( m_Arrived[0].use_count(), 1 );
  m_Arrived.clear();
  EXPECT_EQ( m_pCard->References(), 1u );

  m_pDiscovery->Arrive( *m_pCard );
  EXPECT_EQ( Names(), ( VNames{ "DeckLink C2" } ) );
}

TEST_F( DeckLinkDriver, ItsEndClosesItsDevicesThoughOthersHoldThem )
{
  m_pDriver->StartDiscovery();
  m_pDiscovery->Arrive( *m_pCard );
  ASSERT_EQ( Names().size(), 1u );
  m_pDriver.reset();
  EXPECT_EQ( m_pDiscovery->Callback(), nullptr );
  EXPECT_EQ( m_pDiscovery->References(), 1u );
  EXPECT_FALSE( m_pCard->Input().IsRunning() );
  EXPECT_EQ( m_pCard->References(), 1u );
  EXPECT_EQ( m_Arrived[0]->GetDeviceName(), "DeckLink C1" );
}

TEST_F( DeckLinkDriver, ANotificationThatOutlivesTheDriverDoesNothing )
{
  m_pDriver->StartDiscovery();
  const VComPointer<IDeckLinkDeviceNotificationCallback> pCallback( m_pDiscovery->Callback() );
  m_pDriver.reset();
  EXPECT_EQ( pCallback->DeckLinkDeviceArrived( m_pCard.get() ), S_OK );
  EXPECT_EQ( pCallback->DeckLinkDeviceRemoved( m_pCard.get() ), S_OK );
  EXPECT_EQ( m_pCard->References(), 1u );
}

TEST_F( DeckLinkDriver, AnswersTheVendorForItsOwnInterfaceAlone )
{
  m_pDriver->StartDiscovery();
  auto& rCallback = *m_pDiscovery->Callback();
  for( const REFIID& rId : { IID_IUnknown, IID_IDeckLinkDeviceNotificationCallback } )
  {
    EXPECT_EQ( VideoInputHAL::QueryInterface<IDeckLinkDeviceNotificationCallback>( rCallback, rId ).get(), &rCallback );
  }
  EXPECT_EQ( VideoInputHAL::QueryInterface<IUnknown>( rCallback, IID_IDeckLinkInputCallback ), nullptr );
}

TEST( DeckLinkDriverWithoutRuntime, HasNoCards )
{
  const auto pDriver = KVZ::MakeShared<VBlackmagicDeckLinkDriver>( [] { return nullptr; } );
  pDriver->StartDiscovery();
}

}
