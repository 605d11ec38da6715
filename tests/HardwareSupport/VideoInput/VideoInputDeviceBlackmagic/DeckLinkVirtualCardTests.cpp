// The driver on the virtual runtime library, reached as the vendor's would be. Cards are stepped by hand; the thread that steps is the
// vendor's thread.
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDriver.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDeviceManager.h"
#include "cards/common/VirtualCardControl.h"
#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/DeckLinkFixture.h"
#include "tests/support/CounterReader.h"
#include "tests/support/RampReader.h"

#include <boost/thread/thread.hpp>

#include <dlfcn.h>
#include <future>

namespace
{

using KVZ::IPixelFormat;
using KVZ::ITimecodeSource;
using VideoInputHAL::IVideoInputDevice;
using VideoInputHAL::VBlackmagicDeckLinkDriver;
using VideoInputHAL::VVideoInputDeviceManager;

// Loaded before anybody looks for the vendor's library, which is then this one: it has the same file name.
VirtualCards::IVirtualCardControl& Control()
{
  static VirtualCards::IVirtualCardControl* const s_pControl = []
  {
    void* const pLibrary = dlopen( VIRTUAL_DECKLINK_LIBRARY, RTLD_NOW | RTLD_GLOBAL );
    void* const pFunction = pLibrary ? dlsym( pLibrary, VirtualCards::GetVirtualCardControlName ) : nullptr;
    return pFunction ? reinterpret_cast<VirtualCards::GetVirtualCardControlFunction*>( pFunction )() : nullptr;
  }();
  return *s_pControl;
}

std::optional<uint32_t> CounterIn( const VReceivedFrame& i_rFrame )
{
  return TestSupport::ReadCounter(
    { KVZ::IPixelFormat::EU8Y8V8Y8, i_rFrame.m_Image.data(), i_rFrame.m_Header.m_VideoInfo.m_ImageWidth * size_t( 2 ) } );
}

// Of 16-bit stereo.
std::optional<uint16_t> RampIn( const VReceivedFrame& i_rFrame )
{
  return TestSupport::ReadRamp( { i_rFrame.m_Audio.data(), i_rFrame.m_Audio.size() / 4, 2, 2 }, 2 );
}

class DeckLinkVirtualCard : public ::testing::Test
{
protected:
  VirtualCards::VCardId m_Card = 0;
  std::shared_ptr<TestSupport::VManualPostalService> m_pService = std::make_shared<TestSupport::VManualPostalService>();
  std::shared_ptr<VHeapAllocator> m_pAllocator = std::make_shared<VHeapAllocator>();
  std::shared_ptr<VFrameReceiver> m_pReceiver = std::make_shared<VFrameReceiver>();
  std::vector<std::shared_ptr<IVideoInputDevice>> m_Arrived;
  std::shared_ptr<VBlackmagicDeckLinkDriver> m_pDriver;

  void SetUp() override
  {
    ASSERT_NE( &Control(), nullptr );
    m_pDriver = KVZ::MakeShared<VBlackmagicDeckLinkDriver>();
    m_pDriver->GetDeviceArrivedCallback().Add( [this]( const auto& i_pDevice ) { m_Arrived.push_back( i_pDevice ); }, m_pService );
  }
  void TearDown() override
  {
    m_pDriver.reset();
    m_Arrived.clear();
    m_pService.reset();
    Control().RemoveCard( m_Card );
    EXPECT_EQ( Control().ReferencesHeld(), 0 );
    EXPECT_EQ( Control().ReleaseErrors(), 0 );
    EXPECT_EQ( m_pAllocator->m_Outstanding, 0 );
  }

  void AddCard( const std::string& i_rKeys )
  {
    std::string Error;
    m_Card = Control().AddCard( ( "decklink:" + i_rKeys ).c_str(), { .m_bManualClock = true }, Error );
    ASSERT_EQ( Error, "" );
  }
  void Happen( const char* i_pEvent )
  {
    std::string Error;
    EXPECT_TRUE( Control().RunEvent( m_Card, i_pEvent, Error ) ) << Error;
  }
  void Step( uint64_t i_Frames ) { EXPECT_TRUE( Control().Step( m_Card, i_Frames ) ); }

  // The newest device, wired as the engine does.
  IVideoInputDevice& Wire()
  {
    m_pService->RunAll();
    IVideoInputDevice& rDevice = *m_Arrived.back();
    rDevice.SetDeviceIndex( static_cast<int32_t>( m_Arrived.size() - 1 ) );
    rDevice.SetDataCallback( m_pReceiver );
    rDevice.SetAllocator( m_pAllocator );
    return rDevice;
  }
  // A device whose card has found its signal, capturing.
  IVideoInputDevice& Capture( const std::string& i_rKeys )
  {
    m_pDriver->StartDiscovery();
    AddCard( i_rKeys );
    IVideoInputDevice& rDevice = Wire();
    Step( 1 );
    EXPECT_TRUE( Start( rDevice ).Succeeded() );
    return rDevice;
  }
  static VideoInputHAL::VDeviceResult Start( IVideoInputDevice& i_rDevice, IPixelFormat::Enum i_Format = IPixelFormat::EU8Y8V8Y8,
    uint32_t i_Channels = 2 )
  {
    return i_rDevice.StartCapture( i_Format, ITimecodeSource::EAny, KVZ::IAudioSampleFormat::EInt16, i_Channels );
  }
  std::vector<std::string> Timecodes() const
  {
    std::vector<std::string> Texts;
    for( const VReceivedFrame& rFrame : m_pReceiver->Frames() )
    {
      Texts.push_back( KVZ::ToText( rFrame.m_Timecode ) + "+" + std::to_string( rFrame.m_Timecode.m_TickRemainder ) );
    }
    return Texts;
  }
};

TEST_F( DeckLinkVirtualCard, DeliversEveryFrameWithItsSoundAndTimecode )
{
  Capture( "standard=HD_1280_720P_5000,pattern=counter,audio=ramp" );
  Step( 6 );
  const auto Frames = m_pReceiver->Frames();
  ASSERT_EQ( Frames.size(), 6u );
  const uint32_t FirstNumber = CounterIn( Frames[0] ).value_or( 0 );
  const uint16_t FirstSample = RampIn( Frames[0] ).value_or( 0 );
  for( uint32_t Index = 0; const VReceivedFrame& rFrame : Frames )
  {
    SCOPED_TRACE( Index );
    EXPECT_EQ( rFrame.m_Index, Index );
    EXPECT_EQ( rFrame.m_Period, 2700000 );
    EXPECT_EQ( rFrame.m_Image.size(), 1280u * 720u * 2u );
    EXPECT_EQ( CounterIn( rFrame ), FirstNumber + Index );
    EXPECT_EQ( rFrame.m_Audio.size(), 960u * 2u * 2u );
    EXPECT_EQ( RampIn( rFrame ), static_cast<uint16_t>( FirstSample + 960 * Index ) );
    ++Index;
  }
  // Two frames a label; the card had passed the first before capture began.
  EXPECT_EQ( Timecodes(),
    ( std::vector<std::string>{ "01:00:00:00+0", "01:00:00:01+0", "01:00:00:01+2700000", "01:00:00:02+0", "01:00:00:02+2700000",
      "01:00:00:03+0" } ) );
}

TEST_F( DeckLinkVirtualCard, ACardThatComesBackIsANewDevice )
{
  IVideoInputDevice& rFirst = Capture( "standard=SD_720_576I_5000" );
  Happen( R"({"do": "remove"})" );
  Step( 2 );
  EXPECT_EQ( m_pReceiver->Count(), 0u );
  EXPECT_FALSE( Start( rFirst ).Succeeded() );
  Happen( R"({"do": "arrive"})" );
  Step( 1 );
  IVideoInputDevice& rSecond = Wire();
  EXPECT_EQ( rSecond.GetDeviceName(), "DeckLink C2" );
  EXPECT_TRUE( Start( rSecond ).Succeeded() );
  Step( 2 );
  EXPECT_EQ( m_pReceiver->Frames().back().m_Header.m_DeviceIndex, 1 );
}

TEST_F( DeckLinkVirtualCard, StartsFromAnotherThreadLoseNothingButTheirOwnFrames )
{
  IVideoInputDevice& rDevice = Capture( "standard=SD_720_576I_5000,pattern=counter" );
  std::atomic<bool> bEnd{ false };
  boost::thread Vendor(
    [&]
    {
      for( int Count = 0; !bEnd; ++Count )
      {
        if( Count % 5 == 0 )
        {
          Happen( Count % 10 == 0 ? R"({"do": "format", "standard": "SD_720_486I_5994"})" : R"({"do": "format", "standard": "SD_720_576I_5000"})" );
        }
        Step( 1 );
      }
    } );
  int Failures = 0;
  for( int Count = 0; Count < 60; ++Count )
  {
    Failures += Start( rDevice, Count % 2 == 0 ? IPixelFormat::EU10Y10V10Y10 : IPixelFormat::EU8Y8V8Y8, Count % 3 == 0 ? 0 : 2 ).Succeeded() ? 0 : 1;
    rDevice.GetVideoStandard();
  }
  Failures += Start( rDevice ).Succeeded() ? 0 : 1;
  bEnd = true;
  Vendor.join();
  EXPECT_EQ( Failures, 0 );

  // What came is in order, and the streams run.
  const auto Frames = m_pReceiver->Frames();
  for( size_t Index = 0; Index < Frames.size(); ++Index )
  {
    ASSERT_EQ( Frames[Index].m_Index, Index );
  }
  Step( 2 );
  EXPECT_GT( m_pReceiver->Count(), Frames.size() );
}

TEST_F( DeckLinkVirtualCard, MayEndInMidStream )
{
  for( int Round = 0; Round < 10; ++Round )
  {
    Capture( "standard=SD_720_576I_5000" );
    boost::thread Vendor( [&] { Step( 6 ); } );
    if( Round % 2 == 0 )
    {
      m_Arrived.clear();
    }
    m_pDriver.reset();
    const size_t Delivered = m_pReceiver->Count();
    Vendor.join();
    Step( 2 );
    EXPECT_EQ( m_pReceiver->Count(), Delivered );

    m_Arrived.clear();
    EXPECT_TRUE( Control().RemoveCard( m_Card ) );
    SetUp();
  }
}

// The whole road, on the threads that it has in the field.
TEST_F( DeckLinkVirtualCard, TheManagerAnnouncesCardsAndItsShutdownEndsTheirFrames )
{
  auto pManager = KVZ::MakeShared<VVideoInputDeviceManager>(
    std::vector<VideoInputHAL::VDriverMaker>{ [] { return KVZ::MakeShared<VBlackmagicDeckLinkDriver>(); } } );
  std::promise<std::shared_ptr<IVideoInputDevice>> Added;
  pManager->GetDeviceAddedCallback().Add( [&]( const auto& i_pDevice ) { Added.set_value( i_pDevice ); } );
  pManager->StartDiscovery();
  AddCard( "standard=SD_720_576I_5000" );
  const auto pDevice = Added.get_future().get();
  EXPECT_EQ( pDevice->GetDeviceURN(), "vi:0" );
  pDevice->SetDataCallback( m_pReceiver );
  pDevice->SetAllocator( m_pAllocator );
  Step( 1 );
  ASSERT_TRUE( Start( *pDevice ).Succeeded() );
  Step( 3 );
  EXPECT_EQ( m_pReceiver->Count(), 3u );

  boost::thread Vendor( [&] { Step( 20 ); } );
  pManager->Shutdown();
  const size_t Delivered = m_pReceiver->Count();
  Vendor.join();
  Step( 1 );
  EXPECT_EQ( m_pReceiver->Count(), Delivered );
}

}
