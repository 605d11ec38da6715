// stagehost params: lists, reads and changes the settings of devices.
#include "apps/stagehost/Commands.h"
#include "apps/stagehost/ExitCode.h"
#include "apps/stagehost/HostSession.h"
#include "apps/stagehost/Interrupt.h"
#include "apps/stagehost/TextTable.h"

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <iostream>

using StageHost::VSettingInfo;

namespace
{

constexpr double PollSeconds = 0.02;
constexpr double SettleSeconds = 3.0;

struct VOptions
{
  VSessionOptions m_Session;
  bool m_bJson = false;
  std::string m_Path;
  std::string m_Value;
  CLI::App* m_pList = nullptr;
  CLI::App* m_pGet = nullptr;
  CLI::App* m_pSet = nullptr;
};

nlohmann::ordered_json ToJson( const VSettingInfo& i_rSetting )
{
  return { { "path", i_rSetting.m_Path }, { "value", i_rSetting.m_Value }, { "display", i_rSetting.m_Display },
    { "description", i_rSetting.m_Description }, { "category", i_rSetting.m_Category }, { "minimum", i_rSetting.m_Minimum },
    { "maximum", i_rSetting.m_Maximum }, { "allowed", i_rSetting.m_Allowed }, { "read_only", i_rSetting.m_bReadOnly },
    { "hidden", i_rSetting.m_bHidden }, { "advanced", i_rSetting.m_bAdvanced } };
}

int List( VHostSession& i_rSession, const VOptions& i_rOptions )
{
  nlohmann::ordered_json Json = nlohmann::ordered_json::array();
  VTextTable Table( { "SETTING", "VALUE", "", "DESCRIPTION" } );
  for( const VSettingInfo& rSetting : i_rSession.Settings().List() )
  {
    Json.push_back( ToJson( rSetting ) );
    Table.AddRow( { rSetting.m_Path, rSetting.m_Value, rSetting.m_bReadOnly ? "read-only" : "", rSetting.m_Description } );
  }
  std::cout << ( i_rOptions.m_bJson ? Json.dump( 2 ) + "\n" : Table.ToText() );
  return ExitComplete;
}

int Get( VHostSession& i_rSession, const VOptions& i_rOptions )
{
  const auto Setting = i_rSession.Settings().Find( i_rOptions.m_Path );
  if( !Setting )
  {
    Complain( "There is no setting \"" + i_rOptions.m_Path + "\"; \"params list\" shows them all." );
    return ExitUsage;
  }
  std::cout << ( i_rOptions.m_bJson ? ToJson( *Setting ).dump( 2 ) : Setting->m_Value ) << "\n";
  return ExitComplete;
}

// Shows the value as its owner has settled it.
int Set( VHostSession& i_rSession, const VOptions& i_rOptions )
{
  std::string Error;
  if( !i_rSession.Settings().Set( i_rOptions.m_Path, i_rOptions.m_Value, Error ) )
  {
    Complain( Error );
    return ExitUsage;
  }
  const double Until = i_rSession.Host().Time().Now() + SettleSeconds;
  while( !i_rSession.Settings().IsSettled( i_rOptions.m_Path ) && i_rSession.Host().Time().Now() < Until && WaitUninterrupted( PollSeconds ) )
  {
  }
  return Get( i_rSession, i_rOptions );
}

int Run( const VOptions& i_rOptions )
{
  if( !i_rOptions.m_pList->parsed() && !i_rOptions.m_pGet->parsed() && !i_rOptions.m_pSet->parsed() )
  {
    Complain( "params needs one of: list, get PATH, set PATH VALUE." );
    return ExitUsage;
  }
  VHostSession Session;
  if( const int Result = Session.Start( i_rOptions.m_Session ) )
  {
    return Result;
  }
  if( Session.WaitForDevices( false ).empty() )
  {
    return VHostSession::ExitWithoutDevices();
  }
  const int Result = i_rOptions.m_pList->parsed() ? List( Session, i_rOptions )
    : i_rOptions.m_pGet->parsed()                 ? Get( Session, i_rOptions )
                                                  : Set( Session, i_rOptions );
  return std::cout.flush() ? Result : ExitFailed;
}

}

VCommand AddParamsCommand( CLI::App& io_rApp )
{
  CLI::App& rCommand = *io_rApp.add_subcommand( "params", "List, read and change the settings of devices" );
  auto pOptions = std::make_shared<VOptions>();
  AddSessionOptions( rCommand, pOptions->m_Session );
  rCommand.add_flag( "--json", pOptions->m_bJson, "Print one JSON document" );
  rCommand.require_subcommand( 0, 1 );
  pOptions->m_pList = rCommand.add_subcommand( "list", "All settings" );
  pOptions->m_pGet = rCommand.add_subcommand( "get", "The value of one setting" );
  pOptions->m_pSet = rCommand.add_subcommand( "set", "Change one setting" );
  for( CLI::App* pSub : { pOptions->m_pGet, pOptions->m_pSet } )
  {
    pSub->add_option( "path", pOptions->m_Path, "For example VideoInput.vi:0.Settings.PixelFormat" )->type_name( "PATH" )->required();
  }
  pOptions->m_pSet->add_option( "value", pOptions->m_Value, "The new value, as \"get\" shows it" )->type_name( "VALUE" )->required();
  return [pOptions] { return Run( *pOptions ); };
}
