#include "apps/stagehost/HostSession.h"

#include "StageCoreRuntime/GlobalLog.h"
#include "apps/stagehost/ExitCode.h"
#include "apps/stagehost/Interrupt.h"
#include "apps/stagehost/TextTable.h"

#include <CLI/CLI.hpp>
#include <boost/filesystem/operations.hpp>

#include <algorithm>
#include <cstdio>

using StageHost::VDeviceInfo;

namespace
{

// Real drivers announce their cards within this time.
constexpr double ArrivalSeconds = 1.5;
constexpr double SignalSeconds = 5.0;
constexpr double DeliverySeconds = 2.0;
constexpr double ReactionSeconds = 0.1;

constexpr const char* NoSettings = "none";

constexpr const char* pCardKeys = R"(Keys of a virtual card, parted by commas:
  standard=NAME        a video standard; one that is not carried is answered with a list
  pattern=PATTERN      bars, counter or noise
  timecode=START       HH:MM:SS:FF, HH:MM:SS;FF for drop-frame, or none
  audio=SOUND          tone, ramp, silence or none
  channels=N           1 to 16
  script=FILE          events: signal-loss, format, drop, timecode-jump, timecode-loss, late, remove, arrive
  speed=X              frame rate factor, 0.01 to 100
  loop=0               an input that ends is not begun again
  input=REST           a file, a URL, or FFmpeg's input options; comes last
A card of the kind bluefish444 knows these as well:
  inputs=N             0 to 4
  outputs=N            0 to 4
  connectors=N         0 to 4; as many as inputs by default
  driver=old           a driver that does not tell the card's features)";

std::string JoinURNs( const std::vector<VDeviceInfo>& i_rDevices )
{
  std::string Text;
  for( const VDeviceInfo& rDevice : i_rDevices )
  {
    Text += ( Text.empty() ? "" : ", " ) + rDevice.m_URN;
  }
  return Text;
}

}

void Complain( const std::string& i_rText ) { std::fprintf( stderr, "stagehost: %s\n", OneLine( i_rText ).c_str() ); }

void AddSessionOptions( CLI::App& io_rCommand, VSessionOptions& io_rOptions )
{
  io_rCommand
    .add_option( "--card", io_rOptions.m_Cards, "A virtual card, KIND[:KEY=VALUE[,KEY=VALUE]...], for example decklink:standard=HD_1920_1080P_2500" )
    ->type_name( "CARD" )
    ->allow_extra_args( false );
  io_rCommand
    .add_option( "--settings", io_rOptions.m_SettingsPath,
      "The file of saved settings, or none (default: stagehost/settings.json in $XDG_CONFIG_HOME or ~/.config)" )
    ->type_name( "FILE" );
  io_rCommand.add_flag( "--verbose", io_rOptions.m_bVerbose, "Show the log's information on standard error" );
  io_rCommand.footer( pCardKeys );
}

bool VHostSession::ChooseSettingsFile( std::string& o_rPath ) const
{
  boost::system::error_code Error;
  o_rPath = m_Options.m_SettingsPath == NoSettings ? "" : m_Options.m_SettingsPath;
  if( m_Options.m_SettingsPath.empty() )
  {
    o_rPath = StageHost::DefaultSettingsPath();
  }
  else if( !o_rPath.empty() && !m_Options.m_bMayMakeSettings &&
    boost::filesystem::status( o_rPath, Error ).type() == boost::filesystem::file_not_found )
  {
    Complain( "There is no settings file \"" + o_rPath + "\"." );
    return false;
  }
  return true;
}

int VHostSession::Start( const VSessionOptions& i_rOptions )
{
  m_Options = i_rOptions;
  KVZ::VLogOptions Log;
  Log.m_ConsoleLevel = i_rOptions.m_bVerbose ? KVZ::LogLevel::Detail : KVZ::LogLevel::Warning;
  KVZ::ConfigureLog( Log );

  std::string Error;
  for( const std::string& rCard : i_rOptions.m_Cards )
  {
    if( !m_Cards.Add( rCard, Error ) )
    {
      Complain( Error );
      return ExitUsage;
    }
  }
  StageHost::VHostOptions Options;
  if( !ChooseSettingsFile( Options.m_SettingsPath ) )
  {
    return ExitUsage;
  }
  Options.m_MemoryMiB = i_rOptions.m_MemoryMiB;
  m_pHost = std::make_unique<StageHost::VStandAloneHost>( Options );
  m_pSettings = std::make_unique<StageHost::VDeviceSettings>( m_pHost->GetDataStore(), m_pHost->Parameters() );
  for( const std::string& rMessage : m_pHost->RestoreSettings() )
  {
    Complain( rMessage );
  }
  if( !m_pHost->StartModule( StageHost::ProgramFolder() + "/StageCorePluginVideoInput.tpm", Error ) )
  {
    Complain( Error );
    return ExitFailed;
  }
  return ExitComplete;
}

std::vector<VDeviceInfo> VHostSession::Choose( const std::vector<VDeviceInfo>& i_rDevices ) const
{
  const std::vector<std::string>& rURNs = m_Options.m_DeviceURNs;
  const auto IsChosen = [&]( const VDeviceInfo& i_rDevice )
  { return rURNs.empty() ? i_rDevice.m_bEnabled || !m_Options.m_bLeaveOutDisabled : std::count( rURNs.begin(), rURNs.end(), i_rDevice.m_URN ) != 0; };
  std::vector<VDeviceInfo> Chosen;
  std::copy_if( i_rDevices.begin(), i_rDevices.end(), std::back_inserter( Chosen ), IsChosen );
  return Chosen;
}

std::vector<VDeviceInfo> VHostSession::WaitForDevices( bool i_bNeedSignal )
{
  const double Begin = m_pHost->Time().Now();
  std::vector<VDeviceInfo> Devices;
  do {
    Devices = m_pSettings->GetDevices();
    const double Waited = m_pHost->Time().Now() - Begin;
    const bool bAllThere = m_Cards.Count() > 0 ? Devices.size() >= m_Cards.CountDevices() : !Devices.empty() && Waited > ArrivalSeconds;
    const std::vector<VDeviceInfo> Chosen = Choose( Devices );
    const bool bAllSignals = std::all_of( Chosen.begin(), Chosen.end(), []( const VDeviceInfo& i_rDevice ) { return i_rDevice.HasSignal(); } );
    if( ( bAllThere && bAllSignals ) || Waited > ( Devices.empty() ? ArrivalSeconds : SignalSeconds ) )
    {
      break;
    }
  } while( WaitUninterrupted( PollSeconds ) );

  if( IsInterrupted() )
  {
    Complain( "Interrupted while waiting for the devices." );
    return {};
  }
  if( Devices.empty() )
  {
    Complain( m_Cards.Count() > 0 ? "No device has appeared." : "No device was found. A virtual one comes with --card, for example --card decklink" );
    return {};
  }
  for( const std::string& rURN : m_Options.m_DeviceURNs )
  {
    if( std::none_of( Devices.begin(), Devices.end(), [&]( const VDeviceInfo& i_rDevice ) { return i_rDevice.m_URN == rURN; } ) )
    {
      Complain( "There is no device \"" + rURN + "\"; there are: " + JoinURNs( Devices ) );
      return {};
    }
  }
  Devices = Choose( Devices );
  if( Devices.empty() )
  {
    Complain( "No device is enabled; --device URN takes one all the same." );
  }
  for( const VDeviceInfo& rDevice : Devices )
  {
    if( i_bNeedSignal && !rDevice.HasSignal() )
    {
      Complain( "Device " + rDevice.m_URN + " (" + rDevice.m_Name + ") has no signal." );
      return {};
    }
  }
  return Devices;
}

// The host takes its rate from the first of the sources that deliver; until it has, and the devices have compared theirs with it, their
// warnings tell nothing.
void VHostSession::WaitForDelivery( const std::vector<VDeviceInfo>& i_rDevices )
{
  const auto Delivering = static_cast<size_t>( std::count_if( i_rDevices.begin(), i_rDevices.end(),
    []( const VDeviceInfo& i_rDevice ) { return i_rDevice.HasSignal() && i_rDevice.m_bEnabled; } ) );
  const auto IsRateKnown = [&]
  {
    const auto pSession = m_pHost->Engine().GetStarted();
    return pSession && pSession->m_Sources.size() >= Delivering;
  };
  WaitUntil( DeliverySeconds, [&] { return Delivering == 0 || IsRateKnown(); } );
  WaitUninterrupted( ReactionSeconds );
}

bool VHostSession::WaitUntil( double i_Seconds, const std::function<bool()>& i_Condition ) const
{
  const double Until = m_pHost->Time().Now() + i_Seconds;
  while( !i_Condition() )
  {
    if( m_pHost->Time().Now() > Until || !WaitUninterrupted( PollSeconds ) )
    {
      return i_Condition();
    }
  }
  return true;
}

int VHostSession::ExitWithoutDevices() { return IsInterrupted() ? ExitFailed : ExitNoDevice; }
