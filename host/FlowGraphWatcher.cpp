#include "host/FlowGraphWatcher.h"

#include "CoreVideoUtils/FrameSize.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>

namespace StageHost
{

namespace
{

constexpr size_t LatencyWindow = 8192;
constexpr size_t RateWindow = 64;

// The value below which this part of them lies; 0 of nothing.
double Percentile( std::vector<double> i_Values, double i_Part )
{
  if( i_Values.empty() )
  {
    return 0.0;
  }
  const auto Rank = static_cast<size_t>( static_cast<double>( i_Values.size() - 1 ) * i_Part );
  const auto Place = i_Values.begin() + static_cast<ptrdiff_t>( Rank );
  std::nth_element( i_Values.begin(), Place, i_Values.end() );
  return *Place;
}

// States a second over the moments of a ring.
double Rate( const std::vector<double>& i_rTimes )
{
  if( i_rTimes.size() < 2 )
  {
    return 0.0;
  }
  const auto Ends = std::minmax_element( i_rTimes.begin(), i_rTimes.end() );
  const double Span = *Ends.second - *Ends.first;
  return Span > 0.0 ? static_cast<double>( i_rTimes.size() - 1 ) / Span : 0.0;
}

void Push( std::vector<double>& io_rRing, size_t i_Length, uint64_t i_Count, double i_Value )
{
  if( io_rRing.size() < i_Length )
  {
    io_rRing.push_back( i_Value );
  }
  else
  {
    io_rRing[i_Count % i_Length] = i_Value;
  }
}

}

VFlowWatcher::VFlowWatcher( std::shared_ptr<StageCorePluginInterface::ITimeService> i_pTime, bool i_bKeepNewest )
  : m_pTime( std::move( i_pTime ) ), m_bKeepNewest( i_bKeepNewest )
{
  m_Latencies.reserve( LatencyWindow );
  m_Times.reserve( RateWindow );
}

KVZ::VFlowNodeInfo VFlowWatcher::MakeNodeInfo() { return { "StateWatcher", "Checks and measures the states of a video device", { "Input" }, {} }; }

VWatchFigures VFlowWatcher::GetFigures() const
{
  VWatchFigures Figures;
  std::vector<double> Latencies;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Figures = m_Figures;
    Figures.m_StatesPerSecond = Rate( m_Times );
    Latencies = m_Latencies;
  }
  Figures.m_MedianLatency = Percentile( Latencies, 0.5 );
  Figures.m_Latency99 = Percentile( std::move( Latencies ), 0.99 );
  return Figures;
}

void VFlowWatcher::BeginAnew()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Figures = {};
  m_Session = {};
  m_Latencies.clear();
  m_Times.clear();
}

std::shared_ptr<const KVZ::VFlowVideoFrame> VFlowWatcher::GetNewest() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_pNewest;
}

void VFlowWatcher::Process()
{
  KVZ::VFlowStatePtr pState;
  if( Read( 0, KVZ::VFlowLimit::None(), pState ) )
  {
    const double Now = m_pTime->Now();
    std::shared_ptr<const KVZ::VFlowVideoFrame> pNewest = m_bKeepNewest ? ItemOf<KVZ::VFlowVideoFrame>( *pState ) : nullptr;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Take( *pState, Now );
    m_pNewest.swap( pNewest );   // the former one ends without the lock
  }
}

void VFlowWatcher::Take( const KVZ::IFlowState& i_rState, double i_Now )
{
  const auto pVideo = ItemOf<KVZ::VFlowVideoFrame>( i_rState );
  const auto pAudio = ItemOf<KVZ::VFlowAudioFrame>( i_rState );
  const auto pCamera = ItemOf<KVZ::VFlowCameraHardware>( i_rState );
  const auto pData = ItemOf<KVZ::VFlowGenericData>( i_rState );
  if( !pVideo || !pCamera || !pData )
  {
    Blame( "A state lacks its image, its device or its times." );
    return;
  }
  double DeliveryTime = 0.0;
  double DroppedBefore = 0.0;
  pData->GetNumber( "DeliveryTime", DeliveryTime );
  pData->GetNumber( "DroppedBefore", DroppedBefore );
  CheckPayload( *pVideo, pAudio.get() );
  Follow( *pCamera, static_cast<uint64_t>( DroppedBefore ) );
  Measure( DeliveryTime, i_Now );
  m_Figures.m_Video = pVideo->m_Info;
  m_Figures.m_Audio = pAudio ? pAudio->m_Info : KVZ::AudioFrameInfo();
  m_Figures.m_Timecode = pVideo->m_Timecode;
  ++m_Figures.m_States;
}

void VFlowWatcher::CheckPayload( const KVZ::VFlowVideoFrame& i_rVideo, const KVZ::VFlowAudioFrame* i_pAudio )
{
  if( !i_rVideo.m_pBuffer || i_rVideo.m_pBuffer->Size() == 0 || i_rVideo.m_pBuffer->Size() != CoreVideoUtils::GetFrameSize( i_rVideo.m_Info ) )
  {
    Blame( "An image has not the size that its format says." );
  }
  const size_t SampleBytes = i_pAudio ? KVZ::GetBytesPerSample( i_pAudio->m_Info.m_SampleFormat ) * i_pAudio->m_Info.m_Channels : 0;
  if( i_pAudio && ( !i_pAudio->m_pBuffer || SampleBytes == 0 || i_pAudio->m_pBuffer->Size() % SampleBytes != 0 ) )
  {
    Blame( "The sound of a frame is no whole number of samples." );
  }
}

// Within a session frames lie on a grid of their period: what is missing there was dropped, and told so, or missed.
void VFlowWatcher::Follow( const KVZ::VFlowCameraHardware& i_rCamera, uint64_t i_DroppedBefore )
{
  if( !m_Figures.m_DeviceURN.empty() && m_Figures.m_DeviceURN != i_rCamera.m_DeviceURN )
  {
    Blame( "A state of " + i_rCamera.m_DeviceURN + " came among those of " + m_Figures.m_DeviceURN + "." );
  }
  if( i_rCamera.m_GlobalSession < m_Session )
  {
    Blame( "A state of a session that is over came after one of a later session." );
  }
  if( i_rCamera.m_GlobalSession != m_Session || i_rCamera.m_Period != m_Figures.m_Period )
  {
    ++m_Figures.m_Sessions;
  }
  else
  {
    const KVZ::VTick Step = i_rCamera.m_Tick - m_Figures.m_Tick;
    const int64_t Missed = Step.Count() / i_rCamera.m_Period.Count() - 1 - static_cast<int64_t>( i_DroppedBefore );
    if( Step.Count() % i_rCamera.m_Period.Count() != 0 || Missed < 0 )
    {
      Blame( "A frame lies at the wrong tick." );
    }
    m_Figures.m_MissedFrames += static_cast<uint64_t>( std::max<int64_t>( 0, Missed ) );
  }
  m_Figures.m_DroppedFrames += i_DroppedBefore;
  m_Figures.m_DropRuns += i_DroppedBefore != 0 ? 1 : 0;
  m_Figures.m_DeviceURN = i_rCamera.m_DeviceURN;
  m_Figures.m_DeviceName = i_rCamera.m_DeviceName;
  m_Figures.m_Tick = i_rCamera.m_Tick;
  m_Figures.m_Period = i_rCamera.m_Period;
  m_Session = i_rCamera.m_GlobalSession;
}

void VFlowWatcher::Measure( double i_DeliveryTime, double i_Now )
{
  Push( m_Times, RateWindow, m_Figures.m_States, i_Now );
  Push( m_Latencies, LatencyWindow, m_Figures.m_States, i_Now - i_DeliveryTime );
}

void VFlowWatcher::Blame( const std::string& i_rFault ) { m_Figures.m_FirstFault = m_Figures.m_Faults++ == 0 ? i_rFault : m_Figures.m_FirstFault; }

}
