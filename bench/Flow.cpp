// The live road: from the card's frame to the state in the host's graph, what a state costs, and four cards watched while one is recorded.
#include "NotificationSystem/AsioPostalService.h"
#include "bench/Figures.h"
#include "bench/FrameFeed.h"
#include "bench/Measuring.h"

#include "Flow2/Flow2Utils/FlowNode.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/FlowNodeVideoInputDataSource.h"
#include "host/DeviceSettings.h"
#include "host/FlowGraphWatcher.h"
#include "host/Recording.h"
#include "host/StandAloneHost.h"
#include "host/VirtualCards.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>

#include <algorithm>
#include <functional>
#include <memory>
#include <optional>
#include <stdexcept>

#include <sched.h>

using StageHost::VFlowNodeId;
using StageHost::VFlowWatcher;

namespace
{

constexpr int64_t PollNanoseconds = 20'000'000;
constexpr int64_t SettleNanoseconds = 1'000'000'000;
constexpr double StartSeconds = 10.0;
constexpr double LatencyBoundMilliseconds = 1.0;
constexpr double CostBoundMicroseconds = 20.0;

// Takes what comes, and tells what that costs.
class VReceivingNode : public Flow2Utils::VFlowNode<VReceivingNode>
{
public:
  static KVZ::VFlowNodeInfo MakeNodeInfo() { return { "Receiving", "Counts states", { "Input" }, {} }; }

  // Any thread.
  void WaitFor( uint64_t i_Count ) const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    while( m_Count < i_Count )
    {
      m_Changed.wait( m_Mutex );
    }
  }
  // Of its own thread so far.
  double UsedSeconds() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Seconds;
  }

protected:
  void Process() override
  {
    KVZ::VFlowStatePtr pState;
    Read( 0, KVZ::VFlowLimit::None(), pState );
    pState.reset();
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      ++m_Count;
      m_Seconds = ThreadSeconds();
    }
    m_Changed.notify_all();
  }

private:
  mutable boost::mutex m_Mutex;
  mutable boost::condition_variable_any m_Changed;
  uint64_t m_Count GUARDED_BY( m_Mutex ) = 0;
  double m_Seconds GUARDED_BY( m_Mutex ) = 0.0;
};

// While it lives, the threads that are made stay on one processor with the one that makes them: a wake-up across processors costs what the machine
// makes of it, and the system puts threads elsewhere from second to second.
class VOneProcessor
{
public:
  VOneProcessor()
  {
    cpu_set_t One;
    CPU_ZERO( &One );
    CPU_SET( static_cast<size_t>( sched_getcpu() ), &One );
    sched_getaffinity( 0, sizeof( m_Former ), &m_Former );
    sched_setaffinity( 0, sizeof( One ), &One );
  }
  ~VOneProcessor() { sched_setaffinity( 0, sizeof( m_Former ), &m_Former ); }
  VOneProcessor( const VOneProcessor& ) = delete;
  VOneProcessor& operator=( const VOneProcessor& ) = delete;

private:
  cpu_set_t m_Former = {};
};

// Microseconds of processor time a state.
struct VStateCost
{
  double m_Supply = 0.0;   // the source's thread that wakes the node, and the node
  double m_All = 0.0;      // with the thread of the consumer
};

// Frames one by one through source, node, queue and consumer, each awaited before the next: every thread goes to sleep and wakes up for each of
// them. The thread that delivers and waits is left out.
VStateCost MeasureCost( bool i_bQuick )
{
  constexpr size_t HeldFrames = 1000;
  VFrameFeed Feed( { .m_FrameBytes = VideoInputHAL::VVideoInputDataSourceFrame::HeaderSize, .m_FramesPerBlock = 9, .m_Frames = HeldFrames } );
  const auto pSources = std::make_shared<VideoInputHAL::VVideoInputDataSourceMap>();
  pSources->Insert( "vi:0", std::static_pointer_cast<VideoInputHAL::VVideoInputDataSource>( Feed.Source().shared_from_this() ) );
  Feed.Deliver( Feed.MakeFrame() );
  Feed.JoinSession();

  StageHost::VFlowGraph Graph;
  const auto pReceiver = std::make_shared<VReceivingNode>();
  const VFlowNodeId Source = Graph.AddNode( std::make_shared<VideoInputHAL::VFlowNodeVideoInputDataSource>( pSources ),
    { .m_Name = "Source", .m_Parameters = { { "DeviceURN", "vi:0" } } } );
  const VFlowNodeId Receiver = Graph.AddNode( pReceiver, { .m_Name = "Receiver" } );
  Graph.Connect( { Source, 0 }, { Receiver, 0 } );
  Graph.Start();
  uint64_t Received = 1;
  pReceiver->WaitFor( Received );

  std::vector<double> Supply;
  std::vector<double> All;
  const uint64_t Batch = i_bQuick ? 2000 : 10000;
  for( int Round = 0; Round < 5; ++Round )
  {
    const double Begin = ProcessorSeconds() - ThreadSeconds();
    const double ReceiverBegin = pReceiver->UsedSeconds();
    for( uint64_t Count = 0; Count < Batch; ++Count )
    {
      Feed.Deliver( Feed.MakeFrame() );
      pReceiver->WaitFor( ++Received );
    }
    const double Used = ProcessorSeconds() - ThreadSeconds() - Begin;
    All.push_back( Used / static_cast<double>( Batch ) * 1e6 );
    Supply.push_back( ( Used - ( pReceiver->UsedSeconds() - ReceiverBegin ) ) / static_cast<double>( Batch ) * 1e6 );
  }
  Graph.Stop();
  return { Median( Supply ), Median( All ) };
}

// A host with the module and cards, and a watching node on each device.
class VWatchedHost
{
public:
  explicit VWatchedHost( const std::vector<std::string>& i_rCards )
  {
    std::string Error;
    for( const std::string& rCard : i_rCards )
    {
      Require( m_Cards.Add( rCard, Error ), Error );
    }
    m_pHost = std::make_unique<StageHost::VStandAloneHost>( StageHost::VHostOptions() );
    m_pSettings = std::make_unique<StageHost::VDeviceSettings>( m_pHost->GetDataStore(), m_pHost->Parameters() );
    Require( m_pHost->StartModule( StageHost::ProgramFolder() + "/StageCorePluginVideoInput.tpm", Error ), Error );
    const auto pFactory = m_pHost->FlowNodes().Find( "VideoInputDataSource" );
    Require( pFactory != nullptr, "The module has no flow node." );
    Await( [&] { return m_pHost->Engine().GetStarted() && m_pHost->Engine().GetStarted()->m_Sources.size() == i_rCards.size(); },
      "The cards do not deliver." );
    for( size_t Index = 0; Index < i_rCards.size(); ++Index )
    {
      const std::string URN = "vi:" + std::to_string( Index );
      const VFlowNodeId Source = m_pHost->Flow().AddNode( pFactory->CreateNode(),
        { .m_Name = "Flow " + URN, .m_Parameters = { { "DeviceURN", URN } } } );
      m_Watchers.push_back( std::make_shared<VFlowWatcher>( m_pHost->GetTimeService() ) );
      const VFlowNodeId Watcher = m_pHost->Flow().AddNode( m_Watchers.back(), { .m_Name = "Watch " + URN } );
      m_pHost->Flow().Connect( { Source, 0 }, { Watcher, 0 } );
    }
    m_pHost->Flow().Start();
    Await( [&] { return IsSettled( i_rCards.size() ); }, "The cards do not settle." );
    for( const auto& pWatcher : m_Watchers )
    {
      pWatcher->BeginAnew();
    }
  }

  StageHost::VStandAloneHost& Host() { return *m_pHost; }
  std::vector<StageHost::VWatchFigures> Stop()
  {
    m_pHost->Flow().Stop();
    std::vector<StageHost::VWatchFigures> Figures;
    for( const auto& pWatcher : m_Watchers )
    {
      Figures.push_back( pWatcher->GetFigures() );
      Require( Figures.back().m_Faults == 0, Figures.back().m_FirstFault );
    }
    return Figures;
  }

  static void Require( bool i_bHolds, const std::string& i_rText )
  {
    if( !i_bHolds )
    {
      throw std::runtime_error( i_rText );
    }
  }
  static void Await( const std::function<bool()>& i_rCondition, const std::string& i_rText, double i_Seconds = StartSeconds )
  {
    const int64_t Until = NowNanoseconds() + static_cast<int64_t>( i_Seconds * 1e9 );
    while( !i_rCondition() )
    {
      Require( NowNanoseconds() < Until, i_rText );
      WaitUntil( NowNanoseconds() + PollNanoseconds );
    }
  }

private:
  // No card has asked for a new session for a while: what comes before is the start of devices, not the live road.
  bool IsSettled( size_t i_Cards )
  {
    const auto pSession = m_pHost->Engine().GetStarted();
    const uint32_t Id = pSession && pSession->m_Sources.size() == i_Cards ? pSession->m_Id.Value() : 0;
    if( Id == 0 || Id != m_Session )
    {
      m_Session = Id;
      m_SessionSince = NowNanoseconds();
    }
    return Id != 0 && NowNanoseconds() - m_SessionSince > SettleNanoseconds;
  }

  uint32_t m_Session = 0;
  int64_t m_SessionSince = 0;
  StageHost::VVirtualCards m_Cards;   // taken out when the module has ended
  std::unique_ptr<StageHost::VStandAloneHost> m_pHost;
  std::unique_ptr<StageHost::VDeviceSettings> m_pSettings;
  std::vector<std::shared_ptr<VFlowWatcher>> m_Watchers;
};

std::vector<VFigure> MeasureLatency( bool i_bQuick )
{
  VWatchedHost Watched( { "decklink:standard=HD_1920_1080P_5994,pattern=counter" } );
  WaitUntil( NowNanoseconds() + ( i_bQuick ? 3'000'000'000 : 15'000'000'000 ) );
  const StageHost::VWatchFigures Figures = Watched.Stop().front();
  return {
    { "flow, delivery to state of 1080p59.94, median", Figures.m_MedianLatency * 1e3, "ms", {} },
    { "flow, delivery to state of 1080p59.94, 99th percentile", Figures.m_Latency99 * 1e3, "ms", LatencyBoundMilliseconds },
    { "flow, frames of 1080p59.94 dropped or missed", static_cast<double>( Figures.m_DroppedFrames + Figures.m_MissedFrames ), "", 0.0 },
  };
}

std::vector<VFigure> MeasureFourCards( const VBenchOptions& i_rOptions )
{
  const std::string Card = "decklink:standard=HD_1920_1080P_2500,pattern=counter";
  VWatchedHost Watched( { Card, Card, Card, Card } );
  StageHost::VCaptureTargetOptions Targets;
  Targets.m_Folder = i_rOptions.m_Folder;
  Targets.m_bOverwrite = true;
  Watched.Host().Targets().Configure( Targets );
  StageHost::VRecording Recording( Watched.Host().Engine(), Watched.Host().Targets(), Watched.Host().Time() );
  StageHost::VRecordingRequest Request;
  Request.m_DeviceURNs = { "vi:0" };
  Request.m_Frames = i_rOptions.m_bQuick ? 75 : 250;
  Request.m_Name = "flow";
  std::string Error;
  VWatchedHost::Await( [&] { return Recording.IsReady( Request ); }, "The card is not ready to be recorded." );
  const double Begin = ProcessorSeconds();
  const int64_t BeginTime = NowNanoseconds();
  VWatchedHost::Require( Recording.Start( Request, Error ), Error );
  VWatchedHost::Await(
    [&]
    {
      Recording.Poll();
      return Recording.IsFinished();
    },
    "The recording does not end.", 120.0 );
  const double Load = ( ProcessorSeconds() - Begin ) / ( static_cast<double>( NowNanoseconds() - BeginTime ) * 1e-9 );
  const StageHost::VDeviceOutcome Outcome = Recording.GetOutcomes().front();
  VWatchedHost::Require( !Outcome.HasFailed() && Outcome.m_FramesWritten == *Request.m_Frames, "The recording has failed." );
  uint64_t NotSeen = 0;
  double Latency = 0.0;
  for( const StageHost::VWatchFigures& rFigures : Watched.Stop() )
  {
    NotSeen += rFigures.m_DroppedFrames + rFigures.m_MissedFrames;
    Latency = std::max( Latency, rFigures.m_Latency99 );
  }
  return {
    { "flow, four 1080p25 watched and one recorded, frames lost by the recording", static_cast<double>( Outcome.m_Lost.Total() ), "", 0.0 },
    { "flow, four 1080p25 watched and one recorded, frames in no state", static_cast<double>( NotSeen ), "", 0.0 },
    { "flow, four 1080p25 watched and one recorded, worst 99th percentile", Latency * 1e3, "ms", {} },
    { "flow, four 1080p25 watched and one recorded, processors in use", Load, "", {} },
  };
}

}

std::vector<VFigure> MeasureFlow( const VBenchOptions& i_rOptions )
{
  std::optional<VOneProcessor> One( std::in_place );
  const VStateCost Cost = MeasureCost( i_rOptions.m_bQuick );
  One.reset();
  const VStateCost Spread = MeasureCost( i_rOptions.m_bQuick );
  std::vector<VFigure> Figures = {
    { "flow, processor time to wake the node, make a state and write it", Cost.m_Supply, "us", CostBoundMicroseconds },
    { "flow, processor time a state with the consumer's thread", Cost.m_All, "us", {} },
    { "flow, processor time to wake, make and write, threads on any processor", Spread.m_Supply, "us", {} },
  };
  for( const auto& rMore : { MeasureLatency( i_rOptions.m_bQuick ), MeasureFourCards( i_rOptions ) } )
  {
    Figures.insert( Figures.end(), rMore.begin(), rMore.end() );
  }
  return Figures;
}
