// The capture thread's end, and what happens at once. A deadlock shows as a test that does not end; a lost object or a race, in the sanitizers' runs.
#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Fixture.h"

#include <boost/thread/thread.hpp>

namespace
{

// Wherever the thread rests, in the middle of a set-up too, one sync or the end of the pause lets the device end.
TEST_F( Bluefish444Device, EndsWithinOneFrame )
{
  for( int Rests = 0; Rests < 9; ++Rests )
  {
    SCOPED_TRACE( Rests );
    Make( Rests < 8 ? Mode576i : NoSignal );
    Order( 2 );
    Resume( Rests );
    m_Card.WaitForRest();
    boost::thread End( [&] { m_pDevice->Close(); } );
    do {
      Order();
    } while( m_pDevice->GetStatus() == VDevice::EStatus::ECapturing );   // until orders are refused: the end has begun
    m_Card.TakeCalls();
    m_Card.Release();
    End.join();
    const VCalls Calls = m_Card.TakeCalls();
    EXPECT_EQ( std::count( Calls.begin(), Calls.end(), "Wait" ), 0 );
    const size_t Before = m_pReceiver->Count();
    m_pDevice.reset();
    EXPECT_EQ( m_pReceiver->Count(), Before );
    Fired();
  }
}

TEST_F( Bluefish444Device, ItsOwnPauseEndsWithIt )
{
  m_pDevice = KVZ::MakeShared<VDevice>( Attach(), m_pService );
  m_Card.WaitForRest();
  m_Card.Release();
  m_pDevice.reset();
}

TEST_F( Bluefish444Device, OrdersFramesAndModesMixFreely )
{
  Make();
  m_Card.Freely();
  boost::thread Modes(
    [&]
    {
      for( uint32_t Count = 0; Count < 200; ++Count )
      {
        m_Card.m_Mode = Count % 3 == 0 ? Mode720p5994 : Mode576i;
        m_pDevice->GetVideoStandard();
        m_pDevice->GetTimecode();
        boost::this_thread::yield();
      }
    } );
  for( uint32_t Count = 0; Count < 300; ++Count )
  {
    Order( Count % 17 );
    m_pDevice->SetAllocator( m_pAllocator );
    m_pDevice->SetDataCallback( m_pReceiver );
    m_pDevice->StopCapture();
  }
  Modes.join();
  while( m_pDevice->IsCapturing() )
  {
    boost::this_thread::yield();
  }
}

// The receiver may be the device's last owner: both end on the capture thread.
TEST_F( Bluefish444Device, MayEndOnItsOwnThread )
{
  MakeCapturing();
  const auto pOwner = std::make_shared<VOwningReceiver>();
  m_pDevice->SetDataCallback( pOwner );
  const std::weak_ptr<VDevice> pDevice = m_pDevice;
  pOwner->m_pDevice = std::move( m_pDevice );
  pOwner->m_OnFrame = [&] { pOwner->m_pDevice.reset(); };
  m_Card.Release();
  while( Fake::s_Objects != 0 )
  {
    boost::this_thread::yield();   // until the thread has let the card go
  }
  EXPECT_TRUE( pDevice.expired() );
  EXPECT_EQ( pOwner->Count(), 1u );
}

}
