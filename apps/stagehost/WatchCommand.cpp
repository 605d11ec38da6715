// stagehost watch: runs a flow node on each device and tells what comes out of it.
#include "apps/stagehost/Commands.h"
#include "apps/stagehost/ExitCode.h"
#include "apps/stagehost/HostSession.h"
#include "apps/stagehost/Interrupt.h"
#include "apps/stagehost/NumberCheck.h"
#include "apps/stagehost/Snapshot.h"
#include "apps/stagehost/WatchReport.h"

#include <CLI/CLI.hpp>
#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>

#include <algorithm>

using StageHost::VDeviceInfo;
using StageHost::VFlowNodeId;
using StageHost::VFlowWatcher;

namespace
{

constexpr double RefreshSeconds = 0.25;
constexpr const char* SupplyingNode = "VideoInputDataSource";

struct VWatchOptions
{
  VSessionOptions m_Session;
  double m_Seconds = 0.0;   // 0: until interrupted
  std::string m_Snapshots;
  bool m_bJson = false;
};

// A device with the two nodes that watch it.
struct VWatch
{
  VDeviceInfo m_Device;
  VFlowNodeId m_Source = 0;
  uint64_t m_CardDroppedBefore = 0;   // when the watching began
  std::shared_ptr<VFlowWatcher> m_pWatcher;
};

std::vector<VWatch> MakeGraph( StageHost::VStandAloneHost& i_rHost, const std::vector<VDeviceInfo>& i_rDevices, bool i_bSnapshots )
{
  std::vector<VWatch> Watches;
  const auto pFactory = i_rHost.FlowNodes().Find( SupplyingNode );
  for( size_t Index = 0; pFactory && Index < i_rDevices.size(); ++Index )
  {
    VWatch Watch;
    Watch.m_Device = i_rDevices[Index];
    const std::string& rURN = Watch.m_Device.m_URN;
    Watch.m_Source = i_rHost.Flow().AddNode( pFactory->CreateNode(), { .m_Name = "Flow " + rURN, .m_Parameters = { { "DeviceURN", rURN } } } );
    Watch.m_pWatcher = std::make_shared<VFlowWatcher>( i_rHost.GetTimeService(), i_bSnapshots );
    const VFlowNodeId Watcher = i_rHost.Flow().AddNode( Watch.m_pWatcher, { .m_Name = "Watch " + rURN } );
    i_rHost.Flow().Connect( { Watch.m_Source, 0 }, { Watcher, 0 } );
    Watches.push_back( std::move( Watch ) );
  }
  return Watches;
}

VWatchedDevice Look( VHostSession& i_rSession, const VWatch& i_rWatch, const std::vector<VDeviceInfo>& i_rDevices,
  const std::vector<std::shared_ptr<KVZ::ISource>>& i_rSources )
{
  VWatchedDevice Device;
  Device.m_URN = i_rWatch.m_Device.m_URN;
  Device.m_Name = i_rWatch.m_Device.m_Name;
  Device.m_Figures = i_rWatch.m_pWatcher->GetFigures();
  Device.m_Source = i_rSession.Host().Flow().GetStatus( i_rWatch.m_Source );
  const auto Info = std::find_if( i_rDevices.begin(), i_rDevices.end(),
    [&Device]( const VDeviceInfo& i_rDevice ) { return i_rDevice.m_URN == Device.m_URN; } );
  Device.m_Standard = Info == i_rDevices.end() ? i_rWatch.m_Device.m_Standard : Info->m_Standard;
  const auto Source = std::find_if( i_rSources.begin(), i_rSources.end(),
    [&Device]( const auto& i_pSource ) { return i_pSource->GetSourceName() == Device.m_URN; } );
  if( Source != i_rSources.end() )
  {
    const auto Status = ( *Source )->Temporal().GetSourceSyncStatus();
    Device.m_BufferFill = Status.m_BufferFill;
    Device.m_CardDropped = Status.m_DroppedFrames - i_rWatch.m_CardDroppedBefore;
    Device.m_Timing = ( *Source )->Temporal().GetSourceTimingInfo();
  }
  return Device;
}

std::vector<VWatchedDevice> LookAtAll( VHostSession& i_rSession, const std::vector<VWatch>& i_rWatches )
{
  std::vector<VWatchedDevice> Watched;
  const auto Devices = i_rSession.Settings().GetDevices();
  const auto Sources = i_rSession.Host().Engine().GetSources();
  for( const VWatch& rWatch : i_rWatches )
  {
    Watched.push_back( Look( i_rSession, rWatch, Devices, Sources ) );
  }
  return Watched;
}

// Before anything is started.
int CheckSnapshotFolder( const std::string& i_rFolder )
{
  boost::system::error_code Error;
  boost::filesystem::create_directories( i_rFolder, Error );
  if( Error || !boost::filesystem::is_directory( i_rFolder, Error ) )
  {
    Complain( "The folder \"" + i_rFolder + "\" cannot be made: " + ( Error ? Error.message() : "a file of that name is there" ) + "." );
    return ExitFailed;
  }
  return ExitComplete;
}

bool WriteSnapshots( const std::string& i_rFolder, const std::vector<VWatch>& i_rWatches )
{
  bool bAll = true;
  for( const VWatch& rWatch : i_rWatches )
  {
    const auto pNewest = rWatch.m_pWatcher->GetNewest();
    std::string Error;
    const std::string Path = ( boost::filesystem::path( i_rFolder ) / ( rWatch.m_Device.m_Label + ".png" ) ).string();
    if( pNewest && !WriteSnapshot( *pNewest, Path, Error ) )
    {
      Complain( rWatch.m_Device.m_URN + ": " + Error );
      bAll = false;
    }
  }
  return bAll;
}

int ExitCodeOf( const std::vector<VWatchedDevice>& i_rWatched )
{
  const auto Has = [&]( auto i_Predicate ) { return std::any_of( i_rWatched.begin(), i_rWatched.end(), i_Predicate ); };
  if( Has( []( const VWatchedDevice& i_rDevice ) { return i_rDevice.m_Figures.m_Faults != 0; } ) )
  {
    return ExitFailed;
  }
  if( Has( []( const VWatchedDevice& i_rDevice ) { return i_rDevice.m_CardDropped + i_rDevice.m_Figures.m_MissedFrames != 0; } ) )
  {
    return ExitLostFrames;
  }
  return Has( []( const VWatchedDevice& i_rDevice ) { return i_rDevice.m_Figures.m_States == 0; } ) ? ExitNoDevice : ExitComplete;
}

// False where the graph has ended by itself, which was said on standard error.
bool WatchUntilDone( VHostSession& i_rSession, const std::vector<VWatch>& i_rWatches, double i_Seconds, VWatchReport& io_rReport )
{
  const double Begin = i_rSession.Host().Time().Now();
  double Left = i_Seconds;
  do {
    io_rReport.Refresh( LookAtAll( i_rSession, i_rWatches ) );
    for( const VWatch& rWatch : i_rWatches )
    {
      const auto Status = i_rSession.Host().Flow().GetStatus( rWatch.m_Source );
      if( Status.m_State != StageHost::EFlowNodeState::Running )
      {
        Complain( rWatch.m_Device.m_URN + ": " + ( Status.m_Failure.empty() ? i_rSession.Host().Flow().GetFailure() : Status.m_Failure ) );
        return false;
      }
    }
    Left = i_Seconds - ( i_rSession.Host().Time().Now() - Begin );
  } while( ( i_Seconds == 0.0 || Left > 0.0 ) && WaitUninterrupted( i_Seconds == 0.0 ? RefreshSeconds : std::min( RefreshSeconds, Left ) ) );
  return true;
}

int Watch( VHostSession& i_rSession, const VWatchOptions& i_rOptions, const std::vector<VDeviceInfo>& i_rDevices )
{
  std::vector<VWatch> Watches = MakeGraph( i_rSession.Host(), i_rDevices, !i_rOptions.m_Snapshots.empty() );
  if( Watches.empty() )
  {
    Complain( std::string( "The module has no flow node \"" ) + SupplyingNode + "\"." );
    return ExitFailed;
  }
  VWatchReport Report( i_rOptions.m_bJson );
  for( VWatch& rWatch : Watches )
  {
    rWatch.m_CardDroppedBefore = Look( i_rSession, rWatch, {}, i_rSession.Host().Engine().GetSources() ).m_CardDropped;
  }
  i_rSession.Host().Flow().Start();
  const bool bHealthy = WatchUntilDone( i_rSession, Watches, i_rOptions.m_Seconds, Report );
  const std::vector<VWatchedDevice> Watched = LookAtAll( i_rSession, Watches );
  i_rSession.Host().Flow().Stop();
  const bool bWritten = i_rOptions.m_Snapshots.empty() || WriteSnapshots( i_rOptions.m_Snapshots, Watches );
  return Report.Print( Watched ) && bWritten && bHealthy ? ExitCodeOf( Watched ) : ExitFailed;
}

int Run( const VWatchOptions& i_rOptions )
{
  if( const int Result = i_rOptions.m_Snapshots.empty() ? ExitComplete : CheckSnapshotFolder( i_rOptions.m_Snapshots ) )
  {
    return Result;
  }
  VHostSession Session;
  if( const int Result = Session.Start( i_rOptions.m_Session ) )
  {
    return Result;
  }
  const std::vector<VDeviceInfo> Devices = Session.WaitForDevices( false );
  return Devices.empty() ? VHostSession::ExitWithoutDevices() : Watch( Session, i_rOptions, Devices );
}

}

VCommand AddWatchCommand( CLI::App& io_rApp )
{
  CLI::App& rCommand = *io_rApp.add_subcommand( "watch", "Follow devices live: frame rate, latency, dropped frames" );
  auto pOptions = std::make_shared<VWatchOptions>();
  AddSessionOptions( rCommand, pOptions->m_Session );
  pOptions->m_Session.m_bLeaveOutDisabled = true;
  rCommand.add_option( "--device", pOptions->m_Session.m_DeviceURNs, "A device to watch, such as vi:0; all that are enabled when absent" )
    ->type_name( "URN" )
    ->allow_extra_args( false );
  rCommand.add_option( "--seconds", pOptions->m_Seconds, "How long to watch; until interrupted when absent" )
    ->type_name( "S" )
    ->check( SecondsCheck() );
  rCommand.add_option( "--snapshot", pOptions->m_Snapshots, "Keep the last image of each device there, as LABEL.png" )->type_name( "DIR" );
  rCommand.add_flag( "--json", pOptions->m_bJson, "Print the final figures as one JSON document" );
  return [pOptions] { return Run( *pOptions ); };
}
