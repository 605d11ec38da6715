// From the device's call to the frame linked in the buffer, with the copy of the image left out: frames consist of their header alone.
#include "NotificationSystem/AsioPostalService.h"
#include "bench/Figures.h"
#include "bench/FrameFeed.h"
#include "bench/Measuring.h"

#include <atomic>
#include <stdexcept>
#include <thread>

namespace
{

constexpr size_t FewFrames = 1000;
constexpr size_t ManyFrames = 1000000;
// As many as 1080p frames go into a block of the stand-alone host.
constexpr size_t FramesPerBlock = 9;

struct VCounts
{
  int m_Rounds;
  size_t m_FramesPerRound;
};

VCounts CountsFor( const VBenchOptions& i_rOptions ) { return i_rOptions.m_bQuick ? VCounts{ 7, 5000 } : VCounts{ 31, 20000 }; }

// A feed in its steady state: its memory is full, and every new block is one that eviction has just freed.
std::unique_ptr<VFrameFeed> MakeFullFeed( size_t i_Frames )
{
  VFeedSettings Settings;
  Settings.m_FrameBytes = sizeof( VideoInputHAL::VVideoInputDataSourceFrame );
  Settings.m_FramesPerBlock = FramesPerBlock;
  Settings.m_Frames = i_Frames;
  auto pFeed = std::make_unique<VFrameFeed>( Settings );
  for( size_t Frame = 0; Frame < i_Frames + 10 * FramesPerBlock; ++Frame )
  {
    pFeed->Deliver( pFeed->MakeFrame() );
  }
  const auto Held = static_cast<size_t>( pFeed->HeldFrames() );
  if( Held < i_Frames || Held > i_Frames + 3 * FramesPerBlock )
  {
    throw std::runtime_error( "The buffer holds " + std::to_string( Held ) + " frames instead of " + std::to_string( i_Frames ) + "." );
  }
  return pFeed;
}

// What reading the clock twice takes by itself.
double ClockNanoseconds()
{
  std::vector<double> Times;
  for( int Reading = 0; Reading < 10001; ++Reading )
  {
    const int64_t Begin = NowNanoseconds();
    Times.push_back( static_cast<double>( NowNanoseconds() - Begin ) );
  }
  return Median( std::move( Times ) );
}

// Delivery times of one round, and what they come to.
class VRound
{
public:
  explicit VRound( size_t i_Frames ) : m_Times( i_Frames ) {}

  template<class TAfterFrame>
  void Run( VFrameFeed& i_rFeed, const TAfterFrame& i_rAfterFrame )
  {
    const uint64_t Before = CountAllocations();
    for( double& rTime : m_Times )
    {
      rTime = static_cast<double>( i_rFeed.Deliver( i_rFeed.MakeFrame() ) );
      i_rAfterFrame();
    }
    m_Allocations += CountAllocations() - Before;
    m_Frames += m_Times.size();
    m_Medians.push_back( Median( m_Times ) );
    for( const double Time : m_Times )
    {
      m_Sum += Time;
    }
  }

  const std::vector<double>& Medians() const { return m_Medians; }
  double Mean() const { return m_Sum / static_cast<double>( m_Frames ); }
  double AllocationsPerFrame() const { return static_cast<double>( m_Allocations ) / static_cast<double>( m_Frames ); }

private:
  std::vector<double> m_Times;
  std::vector<double> m_Medians;   // a round
  double m_Sum = 0.0;
  uint64_t m_Allocations = 0;
  size_t m_Frames = 0;
};

double MicrosecondsOf( double i_Nanoseconds, double i_Clock ) { return ( i_Nanoseconds - i_Clock ) / 1000.0; }

// The first round of each warms up.
std::vector<VFigure> CompareHeldFrames( const VCounts& i_rCounts, double i_Clock )
{
  const auto pFew = MakeFullFeed( FewFrames );
  const auto pMany = MakeFullFeed( ManyFrames );
  const auto Nothing = [] {};
  VRound( i_rCounts.m_FramesPerRound ).Run( *pFew, Nothing );
  VRound( i_rCounts.m_FramesPerRound ).Run( *pMany, Nothing );
  VRound Few( i_rCounts.m_FramesPerRound );
  VRound Many( i_rCounts.m_FramesPerRound );
  std::vector<double> Ratios;
  for( int Round = 0; Round < i_rCounts.m_Rounds; ++Round )
  {
    Few.Run( *pFew, Nothing );
    Many.Run( *pMany, Nothing );
    Ratios.push_back( ( Many.Medians().back() - i_Clock ) / ( Few.Medians().back() - i_Clock ) );
  }
  return {
    { "frame path, 1,000 frames held, median", MicrosecondsOf( Median( Few.Medians() ), i_Clock ), "us", 3.0 },
    { "frame path, 1,000,000 frames held, median", MicrosecondsOf( Median( Many.Medians() ), i_Clock ), "us", 3.0 },
    { "frame path, 1,000,000 held over 1,000 held", Median( std::move( Ratios ) ), "x", 1.2 },
    { "frame path, 1,000 frames held, mean", MicrosecondsOf( Few.Mean(), i_Clock ), "us", {} },
    { "frame path, 1,000,000 frames held, mean", MicrosecondsOf( Many.Mean(), i_Clock ), "us", {} },
    { "frame path, allocations a frame", Few.AllocationsPerFrame() + Many.AllocationsPerFrame(), "", 0.0 },
  };
}

// Reads a capture as a writer does, on a thread of its own, and keeps nothing.
class VReadingClient
{
public:
  explicit VReadingClient( std::shared_ptr<SyncSystem::VCaptureBuffer> i_pBuffer ) : m_pBuffer( std::move( i_pBuffer ) )
  {
    m_Id = m_pBuffer->RegisterClient( [this] { m_Service.Post( [this] { Read(); } ); } );
  }
  ~VReadingClient()
  {
    m_pBuffer->UnregisterClient( m_Id );
    m_Service.Stop();
  }

  uint64_t FramesRead() const { return m_FramesRead; }

private:
  void Read()
  {
    SyncSystem::VClientRead Read;
    do {
      SyncSystem::VRefCountedToken Frame;
      m_pBuffer->ClientNextFrame( m_Id, Frame, Read );
      m_FramesRead += Frame ? 1 : 0;
    } while( Read.m_Result == SyncSystem::EClientResult::MoreToCome );
  }

  const std::shared_ptr<SyncSystem::VCaptureBuffer> m_pBuffer;
  NotificationSystem::VAsioPostalService m_Service{ "BenchClient" };
  uint32_t m_Id = 0;
  std::atomic<uint64_t> m_FramesRead{ 0 };
};

// Each frame finds the client asleep and wakes it, as at a card's pace.
std::vector<VFigure> MeasureWhileCapturing( const VCounts& i_rCounts, double i_Clock )
{
  const auto pFeed = MakeFullFeed( FewFrames );
  VReadingClient Client( pFeed->Source().Buffer() );
  SyncSystem::VCaptureRequest Request;
  Request.m_Id = Request.m_Info.m_CaptureSessionId = KVZ::VCaptureSessionId( 1 );
  Request.m_Start = pFeed->Source().Buffer()->GetNextToken();
  if( !pFeed->Source().Buffer()->StartCapture( Request ) )
  {
    throw std::runtime_error( "The buffer refused a capture." );
  }
  uint64_t Delivered = 0;
  const auto AwaitClient = [&]
  {
    ++Delivered;
    while( Client.FramesRead() < Delivered )
    {
      std::this_thread::yield();
    }
  };
  VRound( i_rCounts.m_FramesPerRound ).Run( *pFeed, AwaitClient );
  VRound Capturing( i_rCounts.m_FramesPerRound );
  for( int Round = 0; Round < i_rCounts.m_Rounds / 4 + 1; ++Round )
  {
    Capturing.Run( *pFeed, AwaitClient );
  }
  return {
    { "frame path, capture running, waking its client, median", MicrosecondsOf( Median( Capturing.Medians() ), i_Clock ), "us", {} },
    { "frame path, capture running, allocations a frame", Capturing.AllocationsPerFrame(), "", {} },
  };
}

}

std::vector<VFigure> MeasureFramePath( const VBenchOptions& i_rOptions )
{
  const VCounts Counts = CountsFor( i_rOptions );
  const double Clock = ClockNanoseconds();
  std::vector<VFigure> Figures = CompareHeldFrames( Counts, Clock );
  for( VFigure& rFigure : MeasureWhileCapturing( Counts, Clock ) )
  {
    Figures.push_back( std::move( rFigure ) );
  }
  return Figures;
}
