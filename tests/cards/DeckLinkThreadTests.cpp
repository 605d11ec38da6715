// A virtual card among several threads. Nothing here sleeps: threads wait for each other, and what has been counted must hold in
// every order of events.
#include "tests/cards/DeckLinkClient.h"

#include <boost/thread/latch.hpp>
#include <boost/thread/scoped_thread.hpp>
#include <boost/thread/thread.hpp>

using namespace CardsTests;
using DeckLinkThreads = VCardFixture;
using VThread = boost::scoped_thread<boost::join_if_joinable>;

TEST_F( DeckLinkThreads, OnlyStopWaitsForARunningCallback )
{
  Plug( "decklink" );
  boost::latch Inside( 1 );
  boost::latch GoOn( 1 );
  m_Client.m_OnFrame = [&]( IDeckLinkVideoInputFrame*, IDeckLinkAudioInputPacket* )
  {
    Inside.count_down();
    GoOn.wait();
  };
  Enable();
  Start();
  VThread Stepper( [this] { Control().Step( m_Card, 1 ); } );
  Inside.wait();
  // All of these come back while the callback is running
  EXPECT_EQ( Control().CallbacksInFlight(), 1 );
  EXPECT_EQ( m_pInput->PauseStreams(), S_OK );
  EXPECT_EQ( m_pInput->EnableVideoInput( Mode1080p25, PixelFormat::YUV10Bit, 0 ), S_OK );
  EXPECT_EQ( m_pInput->FlushStreams(), S_OK );
  EXPECT_EQ( m_pInput->StartStreams(), S_OK );
  EXPECT_EQ( m_pInput->SetCallback( nullptr ), S_OK );
  EXPECT_EQ( m_Client.m_References, 2 ) << "the running call still holds it";
  GoOn.count_down();
  EXPECT_EQ( m_pInput->StopStreams(), S_OK );
  EXPECT_EQ( Control().CallbacksInFlight(), 0 );
  EXPECT_EQ( m_Client.m_References, 1 );
}

TEST_F( DeckLinkThreads, AStopFromOutsideWinsOverARestartInsideACallback )
{
  Plug( "decklink" );
  for( int i = 0; i < 50; ++i )
  {
    boost::latch Inside( 1 );
    boost::latch Stopping( 1 );
    m_Client.m_OnFormat = [&]( uint32_t i_Mode )
    {
      Inside.count_down();
      Stopping.wait();
      Restart( i_Mode );
    };
    StartDetecting();
    VThread Stepper( [this] { Control().Step( m_Card, 1 ); } );
    Inside.wait();
    Stopping.count_down();
    EXPECT_EQ( m_pInput->StopStreams(), S_OK );
    const int Frames = m_Client.m_FrameCalls;
    Stepper = VThread();
    Step( 2 );
    EXPECT_EQ( m_Client.m_FrameCalls, Frames );
  }
}

TEST_F( DeckLinkThreads, NoCallbackBeginsAfterAStopInAStormOfStartsAndStops )
{
  Plug( "decklink:standard=SD_720_576I_5000,speed=100", false );
  m_Client.m_OnFormat = [&]( uint32_t i_Mode ) { Restart( i_Mode ); };
  const auto Storm = [this]( uint32_t i_Mode )
  {
    for( int i = 0; i < 500; ++i )
    {
      m_pInput->EnableVideoInput( i_Mode, PixelFormat::YUV8Bit, InputFlag::FormatDetection );
      m_pInput->StartStreams();
      m_pInput->PauseStreams();
      m_pInput->StartStreams();
      m_pInput->SetCallback( &m_Client );
      m_pInput->StopStreams();
    }
  };
  {
    const VThread First( Storm, ModeNTSC );
    const VThread Second( Storm, Mode1080p25 );
  }
  m_pInput->StopStreams();
  const int Formats = m_Client.m_FormatCalls;
  const int Frames = m_Client.m_FrameCalls;
  const uint64_t Passed = Counters().m_FramesPassed;
  while( Counters().m_FramesPassed < Passed + 20 )
  {
    boost::this_thread::yield();
  }
  EXPECT_EQ( m_Client.m_FormatCalls, Formats );
  EXPECT_EQ( m_Client.m_FrameCalls, Frames );
}

TEST_F( DeckLinkThreads, CardsComeAndGoWhileTheyRunAndFramesAreGivenBackElsewhere )
{
  Plug( "decklink:standard=SD_720_576I_5000,speed=100", false );
  boost::mutex Mutex;
  std::vector<VComPointer<IDeckLinkVideoInputFrame>> Kept;
  m_Client.m_OnFrame = [&]( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* )
  {
    const boost::lock_guard<boost::mutex> Lock( Mutex );
    Kept.emplace_back( i_pFrame );
  };
  Enable( FourCharacterCode( "pal " ) );
  Start();
  for( size_t Given = 0; Given < 300; )
  {
    std::vector<VComPointer<IDeckLinkVideoInputFrame>> Mine;
    {
      const boost::lock_guard<boost::mutex> Lock( Mutex );
      Mine.swap( Kept );
    }
    for( const auto& pFrame : Mine )
    {
      PixelsOf( *pFrame );
    }
    Given += Mine.size();
    boost::this_thread::yield();
  }
  // The card goes while its frames flow
  EXPECT_TRUE( Control().RemoveCard( m_Card ) );
  EXPECT_EQ( m_pInput->StartStreams(), E_FAIL );
}

TEST_F( DeckLinkThreads, ACardIsNotTakenOutFromInsideItsCallback )
{
  Plug( "decklink" );
  m_Client.m_OnFrame = [&]( IDeckLinkVideoInputFrame*, IDeckLinkAudioInputPacket* )
  {
    EXPECT_FALSE( Control().RemoveCard( m_Card ) );
    EXPECT_FALSE( Control().Step( m_Card, 1 ) );
  };
  Enable();
  Start();
  Step();
  EXPECT_EQ( m_Client.m_FrameCalls, 1 );
}
