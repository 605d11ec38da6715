// Discovery: which inputs become devices, and what is said of cards that do not.
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Device.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Driver.h"
#include "tests/support/FakeBlueVelvet.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <list>

namespace
{

namespace Fake = TestSupport::FakeBlueVelvet;
namespace Property = BlueVelvet::Property;

using VTexts = std::vector<std::string>;

class Bluefish444Driver : public ::testing::Test
{
protected:
  void TearDown() override
  {
    for( Fake::VCard& rCard : m_Cards )
    {
      rCard.Freely();
    }
    m_pDriver.reset();
    m_Arrived.clear();
    Fake::s_Cards.clear();
    EXPECT_EQ( Fake::s_Objects, 0 );
  }

  Fake::VCard& AddCard( uint32_t i_Streams = 0x10 )
  {
    Fake::VCard& rCard = m_Cards.emplace_back();
    Fake::s_Cards.push_back( &rCard );
    rCard.m_Properties[Property::CardFeatureStreamInfo] = i_Streams;
    return rCard;
  }

  VTexts Discover( const BlueVelvet::VFlatFunctions* i_pFunctions = &Fake::Functions() )
  {
    m_pDriver = KVZ::MakeShared<VideoInputHAL::VBluefish444Driver>( [i_pFunctions] { return i_pFunctions; } );
    m_pDriver->GetDeviceArrivedCallback().AddImmediate( [this]( auto i_pDevice ) { m_Arrived.push_back( i_pDevice ); } );
    m_pDriver->StartDiscovery();
    VTexts Names;
    for( const auto& pDevice : m_Arrived )
    {
      Names.push_back( pDevice->GetDeviceName() );
    }
    return Names;
  }

  std::list<Fake::VCard> m_Cards;
  std::shared_ptr<VideoInputHAL::VBluefish444Driver> m_pDriver;
  std::vector<std::shared_ptr<VideoInputHAL::IVideoInputDevice>> m_Arrived;
  TestSupport::VLogCapture m_Log{ "VideoInputDeviceBluefish444", 6 };
};

TEST_F( Bluefish444Driver, WithoutLibraryOrCardsOneLineIsAll )
{
  EXPECT_EQ( Discover( nullptr ), VTexts() );
  EXPECT_EQ( Discover(), VTexts() );
  ASSERT_EQ( m_Log.Texts(), ( VTexts{ "No Bluefish card detected", "No Bluefish card detected" } ) );
  EXPECT_EQ( m_Log.Lines().front().m_Level, 6 );
}

TEST_F( Bluefish444Driver, EachInputIsADevice )
{
  AddCard( 0x20 );
  Fake::VCard& rSecond = AddCard( 0x42 );
  rSecond.m_Type = 35;
  EXPECT_EQ( Discover(),
    ( VTexts{ "Epoch Horizon C1:ChA", "Epoch Horizon C1:ChB", "Neutron C2:ChA", "Neutron C2:ChB", "Neutron C2:ChC", "Neutron C2:ChD" } ) );
  EXPECT_EQ( m_Arrived[5]->GetDriverName(), "Neutron" );
  EXPECT_EQ( m_Arrived[5]->GetManufacturerName(), "Bluefish 444" );
  EXPECT_EQ( m_Arrived[5]->GetDeviceIndex(), 5 );
  m_pDriver->StartDiscovery();
  EXPECT_EQ( m_Arrived.size(), 6u ) << "inputs are found once";
  EXPECT_EQ( m_Log.Texts(), VTexts() );
}

TEST_F( Bluefish444Driver, ACardThatCannotBeUsedIsPassedOver )
{
  AddCard().m_bAttaches = false;
  AddCard().m_Properties.erase( Property::CardFeatureStreamInfo );
  AddCard().m_Properties.erase( Property::CardFeatureConnectorInfo );
  AddCard( 0x02 );
  AddCard( 0x00 );
  AddCard().m_Properties[Property::CardFeatureConnectorInfo] = 0;
  AddCard( 0x30 ).m_DeadInputs = { 3 };
  AddCard().m_Properties.erase( Property::ProductId );
  EXPECT_EQ( Discover(), ( VTexts{ "Epoch Horizon C7:ChA", "Epoch Horizon C7:ChC", "Epoch Horizon C8:ChA" } ) );
  EXPECT_EQ( m_Log.Texts(),
    ( VTexts{ "Error attaching to card 1.", "Querying card features property is not supported, a later driver is required.",
      "Querying card features property is not supported, a later driver is required.",
      "Card has output channels but no inputs. The outputs should be reconfigured as inputs.", "Card does not have any input channels",
      "Card has no connectors, cannot continue.", "Error attaching input 1 to card 7." } ) );
}

// Somebody still has the device: it delivers nothing any more, has let its card go, and takes orders to no effect.
TEST_F( Bluefish444Driver, ItsEndClosesItsDevices )
{
  AddCard();
  Discover();
  m_Cards.front().Freely();
  m_pDriver.reset();
  EXPECT_EQ( Fake::s_Objects, 0 );
  EXPECT_EQ( m_Arrived.front()->StartCapture( KVZ::IPixelFormat::EU8Y8V8Y8, KVZ::ITimecodeSource::EAny, KVZ::IAudioSampleFormat::EInt16, 0 ).m_Code,
    0 );
  EXPECT_EQ( m_Arrived.front()->GetStatus(), VideoInputHAL::IVideoInputDevice::EStatus::EReady );
}

}
