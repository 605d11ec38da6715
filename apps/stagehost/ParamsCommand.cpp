// stagehost params: lists, reads, changes, resets and watches the settings of devices.
#include "apps/stagehost/Commands.h"
#include "apps/stagehost/ExitCode.h"
#include "apps/stagehost/HostSession.h"
#include "apps/stagehost/Interrupt.h"
#include "apps/stagehost/ParamsList.h"
#include "apps/stagehost/TextTable.h"
#include "host/SettingsWatcher.h"

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <iostream>

using StageHost::VSettingInfo;

namespace
{

constexpr double AnswerSeconds = 3.0;

struct VParamsOptions
{
  VSessionOptions m_Session;
  bool m_bJson = false;
  std::string m_Path;
  std::string m_Value;
};

using VVerb = int ( * )( VHostSession&, const VParamsOptions& );

// What is no UTF-8 is shown all the same.
std::string Dump( const nlohmann::ordered_json& i_rJson, int i_Indent )
{
  return i_rJson.dump( i_Indent, ' ', false, nlohmann::ordered_json::error_handler_t::replace );
}

int List( VHostSession& i_rSession, const VParamsOptions& i_rOptions )
{
  const std::vector<VSettingInfo> Settings = i_rSession.Settings().List();
  const std::vector<VDataPath> Saved = i_rSession.SettingsFile().GetPaths();
  nlohmann::ordered_json Json = nlohmann::ordered_json::array();
  for( const VSettingInfo& rSetting : Settings )
  {
    Json.push_back( ToJson( rSetting, Saved ) );
  }
  std::cout << ( i_rOptions.m_bJson ? Dump( Json, 2 ) + "\n" : ToTree( Settings, Saved ) );
  return ExitComplete;
}

int Get( VHostSession& i_rSession, const VParamsOptions& i_rOptions )
{
  const auto Setting = i_rSession.Settings().Find( i_rOptions.m_Path );
  if( !Setting )
  {
    Complain( "There is no setting \"" + i_rOptions.m_Path + "\"; \"params list\" shows them all." );
    return ExitUsage;
  }
  std::cout << ( i_rOptions.m_bJson ? Dump( ToJson( *Setting, i_rSession.SettingsFile().GetPaths() ), 2 ) : Setting->m_Value ) << "\n";
  return ExitComplete;
}

// False where the owner of a value has not answered in time.
bool AwaitAnswer( VHostSession& i_rSession, const std::string& i_rPath )
{
  return i_rSession.WaitUntil( AnswerSeconds,
    [&]
    {
      const auto Setting = i_rSession.Settings().Find( i_rPath );
      return !Setting || Setting->m_Value.empty() || i_rSession.Settings().IsSettled( i_rPath );
    } );
}

// Shows the value as its owner has settled it, once it is in the file.
int Set( VHostSession& i_rSession, const VParamsOptions& i_rOptions )
{
  std::string Error;
  if( !i_rSession.Settings().Set( i_rOptions.m_Path, i_rOptions.m_Value, Error ) )
  {
    Complain( Error );
    return ExitUsage;
  }
  if( !AwaitAnswer( i_rSession, i_rOptions.m_Path ) )
  {
    Complain( "The device does not answer to " + i_rOptions.m_Path + "; nothing is saved." );
    return ExitFailed;
  }
  if( !i_rSession.SettingsFile().Save( *i_rSession.Host().GetDataStore(), { VDataPath::FromString( i_rOptions.m_Path ) }, Error ) )
  {
    Complain( Error );
    return ExitFailed;
  }
  return Get( i_rSession, i_rOptions );
}

// Also of devices that are not here now.
std::vector<VDataPath> SavedBelow( VHostSession& i_rSession, const std::string& i_rPath )
{
  std::vector<VDataPath> Paths = i_rSession.SettingsFile().GetPaths();
  const VDataPath Branch = VDataPath::FromString( i_rPath );
  const auto IsElsewhere = [&]( const VDataPath& i_rSaved ) { return Branch.IsEmpty() || !i_rSaved.BeginsWith( Branch ); };
  Paths.erase( std::remove_if( Paths.begin(), Paths.end(), IsElsewhere ), Paths.end() );
  return Paths;
}

int Reset( VHostSession& i_rSession, const VParamsOptions& i_rOptions )
{
  std::string Error;
  const std::vector<VDataPath> Saved = SavedBelow( i_rSession, i_rOptions.m_Path );
  const std::vector<VDataPath> Reset = i_rSession.Settings().Reset( i_rOptions.m_Path, Error );
  if( Reset.empty() && Saved.empty() )
  {
    Complain( Error );
    return ExitUsage;
  }
  if( !Saved.empty() && !i_rSession.SettingsFile().Remove( Saved, Error ) )
  {
    Complain( Error );
    return ExitFailed;
  }
  for( const VDataPath& rPath : Saved )
  {
    if( std::count( Reset.begin(), Reset.end(), rPath ) == 0 )
    {
      Complain( rPath.ToString() + " is no longer saved." );
    }
  }
  for( const VDataPath& rPath : Reset )
  {
    AwaitAnswer( i_rSession, rPath.ToString() );
  }
  for( const VDataPath& rPath : Reset )
  {
    const auto Setting = i_rSession.Settings().Find( rPath.ToString() );
    std::cout << rPath.ToString() << " = " << ( Setting ? OneLine( Setting->m_Value ) : "" ) << "\n";
  }
  return ExitComplete;
}

int Watch( VHostSession& i_rSession, const VParamsOptions& i_rOptions )
{
  StageHost::VSettingsWatcher Watcher( i_rSession.Host().Parameters(), i_rOptions.m_Path );
  if( Watcher.Count() == 0 )
  {
    Complain( "There is no setting \"" + i_rOptions.m_Path + "\"; \"params list\" shows them all." );
    return ExitUsage;
  }
  Complain( "watching " + std::to_string( Watcher.Count() ) + " settings" );
  do {
    for( const StageHost::VSettingChange& rChange : Watcher.Take() )
    {
      const nlohmann::ordered_json Json = { { "path", rChange.m_Path }, { "value", rChange.m_Value } };
      std::cout << ( i_rOptions.m_bJson ? Dump( Json, -1 ) : rChange.m_Path + " = " + OneLine( rChange.m_Value ) ) << std::endl;
    }
  } while( std::cout && WaitUninterrupted( PollSeconds ) );
  return ExitComplete;
}

int Run( const VParamsOptions& i_rOptions, VVerb i_pVerb )
{
  VSessionOptions SessionOptions = i_rOptions.m_Session;
  SessionOptions.m_bMayMakeSettings = i_pVerb == &Set || i_pVerb == &Reset;
  VHostSession Session;
  if( const int Result = Session.Start( SessionOptions ) )
  {
    return Result;
  }
  const std::vector<StageHost::VDeviceInfo> Devices = Session.WaitForDevices( false );
  if( Devices.empty() )
  {
    return VHostSession::ExitWithoutDevices();
  }
  if( i_pVerb == &List || i_pVerb == &Get )
  {
    Session.WaitForDelivery( Devices );
  }
  const int Result = i_pVerb( Session, i_rOptions );
  return std::cout.flush() ? Result : ExitFailed;
}

struct VVerbRow
{
  const char* m_pName;
  const char* m_pDescription;
  VVerb m_pVerb;
};
constexpr std::array Verbs = { VVerbRow{ "list", "All settings", &List }, VVerbRow{ "get", "The value of one setting", &Get },
  VVerbRow{ "set", "Change one setting, and keep it for the next runs", &Set },
  VVerbRow{ "reset", "Give one setting, or all below a path, back to its default, and keep it no longer", &Reset },
  VVerbRow{ "watch", "Print a line for each change until interrupted", &Watch } };

}

VCommand AddParamsCommand( CLI::App& io_rApp )
{
  CLI::App& rCommand = *io_rApp.add_subcommand( "params", "List, read, change and watch the settings of devices" );
  auto pOptions = std::make_shared<VParamsOptions>();
  AddSessionOptions( rCommand, pOptions->m_Session );
  rCommand.add_flag( "--json", pOptions->m_bJson, "Print one JSON document; with watch, one a line" );
  rCommand.require_subcommand( 0, 1 );
  std::vector<std::pair<CLI::App*, VVerb>> Subs;
  for( const VVerbRow& rRow : Verbs )
  {
    CLI::App* const pSub = rCommand.add_subcommand( rRow.m_pName, rRow.m_pDescription );
    pSub->fallthrough();
    if( rRow.m_pVerb != &List )
    {
      pSub->add_option( "path", pOptions->m_Path, "For example VideoInput.vi:0.Settings.PixelFormat" )
        ->type_name( "PATH" )
        ->required( rRow.m_pVerb != &Watch );
    }
    if( rRow.m_pVerb == &Set )
    {
      pSub->add_option( "value", pOptions->m_Value, "The new value, as \"get\" shows it" )->type_name( "VALUE" )->required();
    }
    Subs.emplace_back( pSub, rRow.m_pVerb );
  }
  return [pOptions, Subs]() -> int
  {
    const auto Chosen = std::find_if( Subs.begin(), Subs.end(), []( const auto& i_rSub ) { return i_rSub.first->parsed(); } );
    if( Chosen == Subs.end() )
    {
      Complain( "params needs one of: list, get PATH, set PATH VALUE, reset PATH, watch [PATH]." );
      return ExitUsage;
    }
    return Run( *pOptions, Chosen->second );
  };
}
