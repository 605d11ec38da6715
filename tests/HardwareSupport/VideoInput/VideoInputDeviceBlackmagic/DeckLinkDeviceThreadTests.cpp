// What happens at once: the vendor's thread inside a callback, and somebody else starting, closing or letting the device go. A deadlock
// shows as a test that does not end; a lost object or a race, in the sanitizers' runs.
#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/DeckLinkFixture.h"

#include <boost/thread/thread.hpp>

#include <future>

namespace
{

using namespace DeckLinkAPI;

// Stops the first thread that comes by until the test lets it go on.
class VGate
{
public:
  void Pass()
  {
    if( !m_bPassed.exchange( true ) )
    {
      m_Reached.set_value();
      m_Opened.get_future().wait();
    }
  }
  void WaitReached() { m_Reached.get_future().wait(); }
  void Open() { m_Opened.set_value(); }

private:
  std::atomic<bool> m_bPassed{ false };
  std::promise<void> m_Reached;
  std::promise<void> m_Opened;
};

const uint32_t Hp25 = FourCharacterCode( "Hp25" );
const uint32_t Hp60 = FourCharacterCode( "Hp60" );

// Whether StopStreams waits for the frame, which holds the device's lock, or only the lock does.
TEST_F( DeckLinkDevice, StartCaptureWaitsForTheFrameThatIsUnderWay )
{
  InitialiseAndCapture();
  for( const bool bStopWaits : { true, false } )
  {
    SCOPED_TRACE( bStopWaits );
    VGate Gate;
    std::promise<void> Stopping;
    std::atomic<bool> bFrameEnded{ false };
    m_pReceiver->m_OnFrame = [&]
    {
      Gate.Pass();
      bFrameEnded = true;
    };
    Input().ForgetCalls();
    Input().m_bStopWaits = bStopWaits;
    Input().m_OnStopStreams = [&] { Stopping.set_value(); };
    Input().m_OnStartStreams = [&] { EXPECT_TRUE( bFrameEnded ); };

    boost::thread Vendor( [&] { Input().DeliverFrame( {} ); } );
    Gate.WaitReached();
    boost::thread Starter( [&] { EXPECT_TRUE( m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, 2 ).Succeeded() ); } );
    Stopping.get_future().wait();
    Gate.Open();
    Vendor.join();
    Starter.join();
    EXPECT_EQ( Input().Calls(), ( VCalls{ "StopStreams", "EnableVideoInput ntsc 2vuy 1", "EnableAudioInput 48000 16 2", "StartStreams" } ) );
    Input().m_OnStopStreams = nullptr;
    Input().m_OnStartStreams = nullptr;
  }
}

// The format changes while StopStreams is under way: the change must leave the streams to StartCapture, which starts in the new mode.
TEST_F( DeckLinkDevice, AChangeOfFormatDuringStartCaptureIsTakenUpByIt )
{
  InitialiseAndCapture();
  Input().m_OnStopStreams = [&] { boost::thread( [&] { DeliverFormat( Hp60 ); } ).join(); };
  EXPECT_TRUE( m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, 0 ).Succeeded() );
  EXPECT_EQ( Input().Calls(), ( VCalls{ "StopStreams", "EnableVideoInput Hp60 2vuy 1", "StartStreams" } ) );
  EXPECT_TRUE( Input().IsRunning() );
  Input().m_OnStopStreams = nullptr;
}

// A change that waits for the lock while streams are brought up must bring them up again itself.
TEST_F( DeckLinkDevice, AChangeOfFormatRightAfterAStartIsFollowed )
{
  for( int Round = 0; Round < 200; ++Round )
  {
    const auto pDevice = MakeDevice( 2 );
    boost::thread Vendor;
    bool bFirst = true;
    Input().m_OnStartStreams = [&]
    {
      if( std::exchange( bFirst, false ) )
      {
        Vendor = boost::thread( [&] { DeliverFormat( Hp25 ); } );
      }
    };
    ASSERT_TRUE( pDevice->Initialise().Succeeded() );
    Vendor.join();
    ASSERT_EQ( Input().Calls(),
      ( VCalls{ "EnableVideoInput ntsc 2vuy 1", "StartStreams", "PauseStreams", "EnableVideoInput Hp25 2vuy 1", "FlushStreams", "StartStreams" } ) );
    Input().m_OnStartStreams = nullptr;
    pDevice->Close();
    Input().ForgetCalls();
  }
}

TEST_F( DeckLinkDevice, StartsFramesAndChangesOfFormatMixFreely )
{
  InitialiseAndCapture();
  std::atomic<bool> bEnd{ false };
  boost::thread Frames(
    [&]
    {
      for( uint8_t Count = 0; !bEnd; ++Count )
      {
        Input().DeliverFrame( { .m_Flags = Count % 16 == 0 ? FrameFlag::NoInputSource : 0 } );
      }
    } );
  boost::thread Formats(
    [&]
    {
      while( !bEnd )
      {
        DeliverFormat( Hp25 );
        DeliverFormat( Hp60 );
      }
    } );
  std::atomic<int> Failures{ 0 };
  const auto Start = [&]
  {
    for( int Count = 0; Count < 300; ++Count )
    {
      Failures += m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, Count % 2 == 0 ? 2 : 0 ).Succeeded() ? 0 : 1;
      m_pDevice->GetVideoStandard();
      m_pDevice->GetTimecode();
      m_pDevice->StopCapture();
    }
  };
  boost::thread Starter( Start );
  Start();
  Starter.join();
  bEnd = true;
  Frames.join();
  Formats.join();
  EXPECT_EQ( Failures, 0 );
  EXPECT_TRUE( Input().IsRunning() );
}

TEST_F( DeckLinkDevice, DestructionEndsTheStreamsAndDetaches )
{
  InitialiseAndCapture();
  m_pDevice.reset();
  EXPECT_EQ( Input().Calls(), ( VCalls{ "StopStreams", "DisableVideoInput" } ) );
  EXPECT_EQ( Input().Callback(), nullptr );
  EXPECT_EQ( m_pCard->References(), 1u );
  EXPECT_EQ( Input().References(), 1u );
  EXPECT_EQ( m_pAllocator.use_count(), 1 );
}

TEST_F( DeckLinkDevice, AClosedDeviceRefusesToStart )
{
  InitialiseAndCapture();
  m_pDevice->Close();
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::EReady );
  EXPECT_FALSE( m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, 0 ).Succeeded() );
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Could not find requested mode." } ) );
  EXPECT_FALSE( Input().IsRunning() );
}

// The runtime had chosen to call back before it was detached.
TEST_F( DeckLinkDevice, CallbacksThatBeginAfterTheEndDoNothing )
{
  InitialiseAndCapture();
  auto* const pCallback = Input().Callback();
  pCallback->AddRef();
  m_pDevice.reset();
  const auto pFrame = VideoInputHAL::TakeReference( new Fake::VFrame( {} ) );
  const auto pMode = VideoInputHAL::TakeReference( new Fake::VDisplayMode( Hp60 ) );
  EXPECT_EQ( pCallback->VideoInputFrameArrived( pFrame.get(), nullptr ), S_OK );
  EXPECT_EQ( pCallback->VideoInputFormatChanged( FormatChange::DisplayMode, pMode.get(), DetectedSignal::RGB444 ), S_OK );
  pCallback->Release();
  EXPECT_EQ( Fired(), VFired() );
  EXPECT_EQ( m_pReceiver->Count(), 0u );
  EXPECT_FALSE( Input().IsRunning() );
}

// One callback is in the receiver, two wait for the lock; the runtime neither holds the callback object nor waits for its callbacks.
TEST_F( DeckLinkDevice, CallbacksThatWaitForTheLockOutliveTheDevice )
{
  Input().m_bStopWaits = false;
  InitialiseAndCapture();
  VGate Gate;
  m_pReceiver->m_OnFrame = [&] { Gate.Pass(); };
  boost::thread First( [&] { Input().DeliverFrame( {} ); } );
  Gate.WaitReached();
  boost::thread Second( [&] { Input().DeliverFrame( {} ); } );
  boost::thread Third( [&] { DeliverFormat( Hp60 ); } );
  Input().WaitForCallbacks( 3 );

  boost::thread End( [&] { m_pDevice.reset(); } );
  Gate.Open();
  First.join();
  Second.join();
  Third.join();
  End.join();
  EXPECT_FALSE( Input().IsRunning() );
  EXPECT_FALSE( Input().DeliverFrame( {} ) );
}

TEST_F( DeckLinkDevice, ARuntimeThatBorrowsTheCallbackDoesNotLoseItUnderACall )
{
  Input().m_bStopWaits = false;
  Input().m_bHoldsCallback = false;
  InitialiseAndCapture();
  for( int Round = 0; Round < 50; ++Round )
  {
    VGate Gate;
    m_pReceiver->m_OnFrame = [&] { Gate.Pass(); };
    boost::thread Vendor( [&] { Input().DeliverFrame( {} ); } );
    Gate.WaitReached();
    boost::thread End( [&] { m_pDevice.reset(); } );
    Gate.Open();
    Vendor.join();
    End.join();
    m_pDevice = MakeDevice( 1 );
    InitialiseAndCapture();
  }
}

// The receiver's last owner may be the call itself, and the receiver the device's: both end on the vendor's thread, inside the callback.
TEST_F( DeckLinkDevice, MayEndOnTheVendorsThreadWithItsReceiver )
{
  InitialiseAndCapture();
  auto pOwner = std::make_shared<VOwningReceiver>();
  m_pDevice->SetDataCallback( pOwner );
  pOwner->m_pDevice = std::move( m_pDevice );
  const std::weak_ptr<VideoInputHAL::IVideoInputDevice> pDevice = pOwner->m_pDevice;
  pOwner->m_OnFrame = [&] { pOwner.reset(); };
  EXPECT_TRUE( Input().DeliverFrame( {} ) );
  EXPECT_TRUE( pDevice.expired() );
  EXPECT_EQ( Input().Callback(), nullptr );
}

}
