// Runs stagehost and takes its answers apart.
#pragma once

#include "tests/support/ProgramRun.h"
#include "tests/support/WholeFile.h"

#include <nlohmann/json.hpp>

#include <functional>
#include <string>
#include <vector>

namespace SystemTests
{

using TestSupport::ReadFile;
using TestSupport::VRunOptions;
using TestSupport::VRunResult;

using VArguments = std::vector<std::string>;

VArguments operator+( VArguments i_A, const VArguments& i_rB );

// A run that answers with a list of devices. Without one on standard output m_Devices is an empty list.
struct VHostResult
{
  VRunResult m_Run;
  nlohmann::json m_Devices = nlohmann::json::array();

  // The only device, or the one of this index; an empty object where there is none.
  const nlohmann::json& Device( size_t i_Index = 0 ) const;
  std::string Path( size_t i_Index = 0 ) const { return Device( i_Index ).value( "path", std::string() ); }
};

VHostResult RunForDevices( const VArguments& i_rArguments, const VRunOptions& i_rOptions = {} );
// "record --json --output FOLDER" and what is given.
VHostResult Record( const std::string& i_rFolder, const VArguments& i_rArguments, const VRunOptions& i_rOptions = {} );

// "inspect --json" of a file, with its frames if asked for; an empty object with the run's text on a failure.
nlohmann::json Inspect( const std::string& i_rPath, bool i_bFrames = false );

// Everything that the run printed, for the text of a failed check.
std::string Describe( const VRunResult& i_rRun );

// Writes an event script and returns its path.
std::string WriteScript( const std::string& i_rPath, const nlohmann::json& i_rEvents );

// The same event before every frame that is a multiple of i_Every, so that any recording longer than that meets it.
nlohmann::json EveryFrames( uint64_t i_Every, const nlohmann::json& i_rEvent );

// Sends these signals to the program, once, as soon as what it has printed to standard error is as wanted.
VRunOptions SignalOnce( std::vector<int> i_Signals, std::function<bool( const std::string& )> i_IsTime );
// Whether a program with --progress has told by now that so many frames are captured.
bool HasCaptured( const std::string& i_rText, int64_t i_Frames );
// As soon as the program, which needs --progress, tells that so many frames are captured.
VRunOptions SignalAfterFrames( std::vector<int> i_Signals, int64_t i_Frames );

// The whole numbers behind each occurrence of a text: NumbersBehind( "frames_captured=", ... ).
std::vector<int64_t> NumbersBehind( const std::string& i_rWords, const std::string& i_rText );

}
