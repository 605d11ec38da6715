#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDeviceManager.h"

#include "tests/support/FakeVideoInputDevice.h"
#include "tests/support/LogCapture.h"

#include <boost/thread/thread.hpp>
#include <gtest/gtest.h>

#include <future>

namespace
{

using namespace VideoInputHAL;
using TestSupport::VFakeVideoInputDevice;
using TestSupport::VFakeVideoInputDriver;
using VDevices = std::vector<std::shared_ptr<IVideoInputDevice>>;

class VideoInputDeviceManager : public ::testing::Test
{
protected:
  std::shared_ptr<VFakeVideoInputDriver> m_pFirst = std::make_shared<VFakeVideoInputDriver>();
  std::shared_ptr<VFakeVideoInputDriver> m_pSecond = std::make_shared<VFakeVideoInputDriver>();
  std::shared_ptr<VVideoInputDeviceManager> m_pManager = KVZ::MakeShared<VVideoInputDeviceManager>(
    std::vector<VDriverMaker>{ [this] { return m_pFirst; }, [this] { return m_pSecond; } } );
  std::shared_ptr<TestSupport::VManualPostalService> m_pListenerService = std::make_shared<TestSupport::VManualPostalService>();
  std::vector<std::string> m_Announced;

  static std::shared_ptr<IVideoInputDevice> Device() { return std::make_shared<VFakeVideoInputDevice>(); }
  void Listen()
  {
    m_pManager->GetDeviceAddedCallback().Add(
      [this]( const std::shared_ptr<IVideoInputDevice>& i_pDevice ) { m_Announced.push_back( i_pDevice->GetDeviceURN() ); }, m_pListenerService );
  }
  VDevices Devices() const
  {
    VDevices Devices;
    m_pManager->GetDevices( Devices );
    return Devices;
  }
};

TEST_F( VideoInputDeviceManager, WithoutCardsThereAreNoDevices )
{
  TestSupport::VLogCapture Log( "VideoInputHAL" );
  m_pManager->StartDiscovery();
  EXPECT_TRUE( Devices().empty() );
  EXPECT_EQ( m_pManager->GetDevice( 0 ), nullptr );
  EXPECT_EQ( m_pManager->GetDeviceURN( 0 ), "" );
  ASSERT_EQ( Log.Count( "Device identifier not found." ), 2u );
  EXPECT_EQ( Log.Lines().front().m_Level, 2 );
}

TEST_F( VideoInputDeviceManager, DriversShareOneIndexSpaceInOrderOfArrival )
{
  m_pFirst->m_OnDiscovery = { Device() };
  m_pSecond->m_OnDiscovery = { Device(), Device() };
  Listen();
  m_pManager->StartDiscovery();
  const auto pLate = Device();
  m_pFirst->m_DeviceArrived( pLate );

  EXPECT_EQ( Devices(), ( VDevices{ m_pFirst->m_OnDiscovery[0], m_pSecond->m_OnDiscovery[0], m_pSecond->m_OnDiscovery[1], pLate } ) );
  EXPECT_EQ( m_pManager->GetDevice( 3 ), pLate );
  EXPECT_EQ( m_pManager->GetDeviceURN( 3 ), "vi:3" );
  EXPECT_TRUE( m_Announced.empty() );
  m_pListenerService->RunAll();
  Listen();   // too late, and not told again
  m_pListenerService->RunAll();
  EXPECT_EQ( m_Announced, ( std::vector<std::string>{ "vi:0", "vi:1", "vi:2", "vi:3" } ) );
}

TEST_F( VideoInputDeviceManager, AnnouncesADeviceWithItsIndexBeforeItJoinsTheList )
{
  std::string URNThen;
  m_pManager->GetDeviceAddedCallback().AddImmediate(
    [&]( const auto& i_pDevice )
    {
      EXPECT_TRUE( Devices().empty() );
      URNThen = i_pDevice->GetDeviceURN();
    } );
  std::promise<boost::thread::id> Thread;
  m_pManager->GetDeviceAddedCallback().Add( [&]( const auto& ) { Thread.set_value( boost::this_thread::get_id() ); } );
  m_pFirst->m_DeviceArrived( Device() );
  EXPECT_EQ( URNThen, "vi:0" );
  EXPECT_EQ( Devices().size(), 1u );
  EXPECT_NE( Thread.get_future().get(), boost::this_thread::get_id() ) << "listeners without a service of their own";
}

TEST_F( VideoInputDeviceManager, ShutdownLetsDevicesAndDriversGoAndKeepsTheIndices )
{
  Listen();
  const auto pDevice = Device();
  m_pFirst->m_DeviceArrived( pDevice );
  m_pManager->Shutdown();

  TestSupport::VLogCapture Log( "VideoInputHAL" );
  EXPECT_EQ( m_pManager->GetDevice( 0 ), nullptr );
  EXPECT_EQ( m_pManager->GetDeviceURN( 0 ), "" );
  EXPECT_TRUE( Log.Lines().empty() );
  EXPECT_EQ( m_pManager->GetDevice( 1 ), nullptr );
  EXPECT_EQ( Log.Lines().size(), 1u );

  EXPECT_EQ( m_pFirst.use_count(), 1 );
  EXPECT_EQ( m_pFirst->m_DeviceArrived.Count(), 0u );
  EXPECT_EQ( m_pManager->GetDeviceAddedCallback().Count(), 0u );
  m_pManager->StartDiscovery();
  m_pListenerService->RunAll();
  EXPECT_EQ( pDevice.use_count(), 1 );
}

TEST_F( VideoInputDeviceManager, AnArrivalAfterTheManagersEndDoesNothing )
{
  m_pManager.reset();
  m_pFirst->m_DeviceArrived( Device() );
  EXPECT_EQ( m_pFirst->m_DeviceArrived.Count(), 0u );
}

TEST_F( VideoInputDeviceManager, ArrivalsOnSeveralThreadsWhileOthersReadGetIndicesOfTheirOwn )
{
  constexpr int PerDriver = 100;
  const auto Announce = []( VFakeVideoInputDriver& i_rDriver )
  {
    for( int Count = 0; Count < PerDriver; ++Count )
    {
      i_rDriver.m_DeviceArrived( Device() );
    }
  };
  boost::thread First( Announce, boost::ref( *m_pFirst ) );
  boost::thread Second( Announce, boost::ref( *m_pSecond ) );
  while( Devices().size() < 2 * PerDriver )
  {
  }
  First.join();
  Second.join();
  for( uint32_t Index = 0; Index < 2 * PerDriver; ++Index )
  {
    ASSERT_EQ( m_pManager->GetDeviceURN( Index ), MakeDeviceURN( static_cast<int32_t>( Index ) ) );
  }
}

}
