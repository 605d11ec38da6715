// What happens at once: the vendor's thread inside a callback, and somebody else starting, closing or letting the device go. A deadlock
// shows as a test that does not end; a lost object or a race, in the sanitizers' runs.
#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/DeckLinkFixture.h"

#include <boost/thread/scoped_thread.hpp>
#include <boost/thread/thread.hpp>

#include <future>

namespace
{

using namespace DeckLinkAPI;

using VThread = boost::scoped_thread<boost::join_if_joinable>;

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

    {
      const VThread Vendor( [&] { Input().DeliverFrame( {} ); } );
      Gate.WaitReached();
      const VThread Starter( [&] { EXPECT_TRUE( m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, 2 ).Succeeded() ); } );
      Stopping.get_future().wait();
      Gate.Open();
    }
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
  const auto DeliverFrames = [&]
  {
    for( uint8_t Count = 0; !bEnd; ++Count )
    {
      Input().DeliverFrame( { .m_Flags = Count % 16 == 0 ? FrameFlag::NoInputSource : 0 } );
    }
  };
  const auto ChangeFormats = [&]
  {
    while( !bEnd )
    {
      DeliverFormat( Hp25 );
      DeliverFormat( Hp60 );
    }
  };
  const auto StartAndStop = [&]
  {
    for( int Count = 0; Count < 300; ++Count )
    {
      EXPECT_TRUE( m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, Count % 2 == 0 ? 2 : 0 ).Succeeded() );
      m_pDevice->GetVideoStandard();
      m_pDevice->GetTimecode();
      m_pDevice->StopCapture();
    }
  };
  {
    const VThread Frames( DeliverFrames );
    const VThread Formats( ChangeFormats );
    boost::thread Starter( StartAndStop );
    StartAndStop();
    Starter.join();
    bEnd = true;
  }
  EXPECT_TRUE( Input().IsRunning() );
}

TEST_F( DeckLinkDevice, ItsEndEndsTheStreamsAndDetaches )
{
  InitialiseAndCapture();
  m_pDevice->Close();
  EXPECT_EQ( Input().Calls(), ( VCalls{ "StopStreams", "DisableVideoInput" } ) );
  EXPECT_EQ( Input().Callback(), nullptr );
  EXPECT_EQ( m_pCard->References(), 1u );
  EXPECT_EQ( Input().References(), 1u );
  EXPECT_EQ( m_pAllocator.use_count(), 1 );
  // Whoever still holds it cannot start it again
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
  {
    const VThread First( [&] { Input().DeliverFrame( {} ); } );
    Gate.WaitReached();
    const VThread Second( [&] { Input().DeliverFrame( {} ); } );
    const VThread Third( [&] { DeliverFormat( Hp60 ); } );
    Input().WaitForCallbacks( 3 );
    const VThread End( [&] { m_pDevice.reset(); } );
    Gate.Open();
  }
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
    {
      const VThread Vendor( [&] { Input().DeliverFrame( {} ); } );
      Gate.WaitReached();
      const VThread End( [&] { m_pDevice.reset(); } );
      Gate.Open();
    }
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
