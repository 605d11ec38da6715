// stagehost: the stand-alone host on a command line. Results go to standard output, everything else to standard error.
#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "apps/stagehost/Commands.h"
#include "apps/stagehost/ExitCode.h"
#include "apps/stagehost/Interrupt.h"

#include <CLI/CLI.hpp>

#include <csignal>
#include <cstdio>
#include <exception>
#include <vector>

int main( int i_ArgumentCount, char** i_ppArguments )
{
  // A full disk or a closed pipe is a result of the write, not the end of the program.
  std::signal( SIGXFSZ, SIG_IGN );
  std::signal( SIGPIPE, SIG_IGN );
  InstallInterrupt();
  DebugServices::InstallCrashHandler();
  const DebugServices::VCrashHandlerForThread CrashHandler;

  CLI::App App( "Runs the video input module without the closed host: finds capture cards, records them, and reads the files.", "stagehost" );
  App.require_subcommand( 0, 1 );
  std::vector<std::pair<CLI::App*, VCommand>> Commands;
  for( const auto& pAdd : { &AddDevicesCommand, &AddRecordCommand, &AddInspectCommand, &AddParamsCommand, &AddWatchCommand } )
  {
    VCommand Command = pAdd( App );
    Commands.emplace_back( App.get_subcommands( nullptr ).back(), std::move( Command ) );
  }

  try
  {
    App.parse( i_ArgumentCount, i_ppArguments );
  }
  catch( const CLI::ParseError& rError )
  {
    if( rError.get_exit_code() == 0 )
    {
      return App.exit( rError );
    }
    std::fprintf( stderr, "stagehost: %s\n", rError.what() );
    return ExitUsage;
  }
  try
  {
    for( const auto& rCommand : Commands )
    {
      if( rCommand.first->parsed() )
      {
        const int Result = rCommand.second();
        KVZ::ConfigureLog( {} );   // the log tells of repeated lines that it is still counting
        return Result;
      }
    }
  }
  catch( const std::exception& rError )
  {
    std::fprintf( stderr, "stagehost: %s\n", rError.what() );
    return ExitFailed;
  }
  std::fputs( "stagehost: a command is needed: devices, record, watch, inspect or params; --help tells more.\n", stderr );
  return ExitUsage;
}
