#include "tests/support/system/StageHost.h"

#include <csignal>
#include <cstdlib>
#include <fstream>
#include <utility>

namespace SystemTests
{

VArguments operator+( VArguments i_A, const VArguments& i_rB )
{
  i_A.insert( i_A.end(), i_rB.begin(), i_rB.end() );
  return i_A;
}

const nlohmann::json& VHostResult::Device( size_t i_Index ) const
{
  static const nlohmann::json s_Nothing = nlohmann::json::object();
  return i_Index < m_Devices.size() ? m_Devices[i_Index] : s_Nothing;
}

VHostResult RunForDevices( const VArguments& i_rArguments, const VRunOptions& i_rOptions )
{
  VHostResult Result;
  Result.m_Run = TestSupport::RunStageHost( i_rArguments, i_rOptions );
  nlohmann::json Document = nlohmann::json::parse( Result.m_Run.m_Output, nullptr, false );
  if( Document.is_array() )
  {
    Result.m_Devices = std::move( Document );
  }
  return Result;
}

VHostResult Record( const std::string& i_rFolder, const VArguments& i_rArguments, const VRunOptions& i_rOptions )
{
  return RunForDevices( VArguments{ "record", "--json", "--output", i_rFolder } + i_rArguments, i_rOptions );
}

nlohmann::json Inspect( const std::string& i_rPath, bool i_bFrames )
{
  const VRunResult Run = TestSupport::RunStageHost(
    VArguments{ "inspect", "--json", i_rPath } + ( i_bFrames ? VArguments{ "--frames" } : VArguments{} ) );
  nlohmann::json Document = nlohmann::json::parse( Run.m_Output, nullptr, false );
  return Document.is_object() && Run.m_ExitCode == 0 ? Document : nlohmann::json{ { "failure", Describe( Run ) } };
}

std::string Describe( const VRunResult& i_rRun )
{
  return "exit code " + std::to_string( i_rRun.m_ExitCode ) + ", signal " + std::to_string( i_rRun.m_Signal ) +
    ( i_rRun.m_bTimedOut ? ", timed out" : "" ) + "\nstandard output: " + i_rRun.m_Output + "\nstandard error: " + i_rRun.m_Error;
}

std::string WriteScript( const std::string& i_rPath, const nlohmann::json& i_rEvents )
{
  std::ofstream( i_rPath ) << i_rEvents;
  return i_rPath;
}

nlohmann::json EveryFrames( uint64_t i_Every, const nlohmann::json& i_rEvent )
{
  constexpr uint64_t LastFrame = 5000;
  nlohmann::json Events = nlohmann::json::array();
  for( uint64_t Frame = i_Every; Frame <= LastFrame; Frame += i_Every )
  {
    nlohmann::json Event = i_rEvent;
    Event["frame"] = Frame;
    Events.push_back( std::move( Event ) );
  }
  return Events;
}

VRunOptions SignalOnce( std::vector<int> i_Signals, std::function<bool( const std::string& )> i_IsTime )
{
  VRunOptions Options;
  Options.m_OnErrorText = [i_Signals, i_IsTime, bSent = false]( pid_t i_Child, const std::string& i_rText ) mutable
  {
    if( bSent || !i_IsTime( i_rText ) )
    {
      return;
    }
    bSent = true;
    for( const int Signal : i_Signals )
    {
      kill( i_Child, Signal );
    }
  };
  return Options;
}

bool HasCaptured( const std::string& i_rText, int64_t i_Frames )
{
  const std::vector<int64_t> Captured = NumbersBehind( "frames_captured=", i_rText );
  return !Captured.empty() && Captured.back() >= i_Frames;
}

VRunOptions SignalAfterFrames( std::vector<int> i_Signals, int64_t i_Frames )
{
  return SignalOnce( std::move( i_Signals ), [i_Frames]( const std::string& i_rText ) { return HasCaptured( i_rText, i_Frames ); } );
}

std::vector<int64_t> NumbersBehind( const std::string& i_rWords, const std::string& i_rText )
{
  std::vector<int64_t> Numbers;
  for( size_t Place = i_rText.find( i_rWords ); Place != std::string::npos; Place = i_rText.find( i_rWords, Place + 1 ) )
  {
    Numbers.push_back( std::strtoll( i_rText.c_str() + Place + i_rWords.size(), nullptr, 10 ) );
  }
  return Numbers;
}

}
