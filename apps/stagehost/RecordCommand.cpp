// stagehost record: writes a range of frames of one or more devices to files.
#include "Core/VideoInterface/Timecode.h"
#include "apps/stagehost/Commands.h"
#include "apps/stagehost/ConverterOptions.h"
#include "apps/stagehost/ExitCode.h"
#include "apps/stagehost/FileValidation.h"
#include "apps/stagehost/HostSession.h"
#include "apps/stagehost/Interrupt.h"
#include "apps/stagehost/NumberCheck.h"
#include "apps/stagehost/RecordFormat.h"
#include "apps/stagehost/RecordReport.h"
#include "apps/stagehost/StoredFormat.h"
#include "host/Recording.h"

#include <CLI/CLI.hpp>
#include <boost/filesystem/operations.hpp>

#include <algorithm>

using StageHost::VDeviceInfo;
using StageHost::VDeviceSettings;

namespace
{

constexpr double ReadySeconds = 10.0;
constexpr double SettleSeconds = 5.0;
constexpr double MostFrames = 1e8;
constexpr double LongestPreRoll = 3600.0;
constexpr double MostMemoryMiB = 1048576.0;

struct VRecordOptions
{
  VSessionOptions m_Session;
  VReportOptions m_Report;
  double m_Seconds = 0.0;
  uint64_t m_Frames = 0;
  double m_PreRoll = 0.0;
  VFormatOptions m_Format;
  VConverterOptions m_Converter;
  std::string m_Output;
  std::string m_Name = "take";
  bool m_bOverwrite = false;
};

// Before anything is started: what can be seen to be wrong from the command line and the file system.
int CheckOutput( const VRecordOptions& i_rOptions )
{
  boost::system::error_code Error;
  boost::filesystem::create_directories( i_rOptions.m_Output, Error );
  if( Error || !boost::filesystem::is_directory( i_rOptions.m_Output, Error ) )
  {
    Complain(
      "The output folder \"" + i_rOptions.m_Output + "\" cannot be made: " + ( Error ? Error.message() : "a file of that name is there" ) + "." );
    return ExitFailed;
  }
  return ExitComplete;
}

bool SetEnabled( VHostSession& i_rSession, const std::string& i_rURN, bool i_bEnabled )
{
  const std::string Path = VDeviceSettings::SettingPath( i_rURN, "Enabled" );
  std::string Error;
  return i_rSession.Settings().Set( Path, i_bEnabled ? "true" : "false", Error ) &&
    i_rSession.WaitUntil( SettleSeconds,
      [&]
      {
        const bool bReady = i_rSession.Settings().Find( "VideoInput." + i_rURN + ".Hardware.Status" )->m_Value == "Ready";
        return i_rSession.Settings().IsSettled( Path ) && bReady != i_bEnabled;
      } );
}

bool Set( VHostSession& i_rSession, const VDeviceInfo& i_rDevice, const VWantedSetting& i_rSetting )
{
  std::string Error;
  if( i_rSession.Settings().Set( VDeviceSettings::SettingPath( i_rDevice.m_URN, i_rSetting.m_pKey ), i_rSetting.m_Value, Error ) )
  {
    return true;
  }
  Complain( i_rSetting.m_Option + ": " + Error );
  return false;
}

// The device offers other payloads with another container, and changes one that it no longer offers: both have happened when this is true.
bool AwaitPayloads( VHostSession& i_rSession, const VDeviceInfo& i_rDevice, const VRecordFormat& i_rFormat )
{
  return i_rSession.WaitUntil( SettleSeconds,
    [&]
    {
      const auto Payload = i_rSession.Settings().Find( VDeviceSettings::SettingPath( i_rDevice.m_URN, "VideoPayload" ) );
      return Payload && Payload->m_Allowed == i_rFormat.OfferedVideoPayloads() &&
        std::count( Payload->m_Allowed.begin(), Payload->m_Allowed.end(), Payload->m_Value ) > 0;
    } );
}

// What the device offers depends on its signal, whose news may come one after the other: what a stopped device says stays.
VDeviceInfo ReadAgain( VHostSession& i_rSession, const VDeviceInfo& i_rDevice )
{
  const std::vector<VDeviceInfo> Devices = i_rSession.Settings().GetDevices();
  const auto Found = std::find_if( Devices.begin(), Devices.end(), [&]( const VDeviceInfo& i_rOther ) { return i_rOther.m_URN == i_rDevice.m_URN; } );
  return Found != Devices.end() ? *Found : i_rDevice;
}

// While the device is stopped, so that the next buffer session holds frames of these settings alone.
int ApplySettings( VHostSession& i_rSession, const VRecordOptions& i_rOptions, const VDeviceInfo& i_rDevice )
{
  if( !SetEnabled( i_rSession, i_rDevice.m_URN, false ) )
  {
    Complain( "Device " + i_rDevice.m_URN + " cannot be stopped to change its settings." );
    return ExitFailed;
  }
  const VDeviceInfo Device = ReadAgain( i_rSession, i_rDevice );
  const VRecordFormat Format( i_rOptions.m_Format, Device );
  std::string Refusal = Format.WhyRefused();
  if( Refusal.empty() )
  {
    Refusal = WhyRefused( i_rOptions.m_Converter, i_rOptions.m_Format, Device );
  }
  if( !Refusal.empty() )
  {
    Complain( Refusal );
    return ExitUsage;
  }
  if( const std::string Change = Format.WhatGaveWay(); !Change.empty() )
  {
    Complain( Change );
  }
  if( !Set( i_rSession, i_rDevice, Format.Container() ) )
  {
    return ExitUsage;
  }
  if( !AwaitPayloads( i_rSession, i_rDevice, Format ) )
  {
    Complain( "Device " + i_rDevice.m_URN + " does not take its container." );
    return ExitFailed;
  }
  const std::vector<VWantedSetting> Settings = Format.Settings();
  if( !std::all_of( Settings.begin(), Settings.end(), [&]( const VWantedSetting& i_rSetting ) { return Set( i_rSession, i_rDevice, i_rSetting ); } ) )
  {
    return ExitUsage;
  }
  if( !SetEnabled( i_rSession, i_rDevice.m_URN, true ) )
  {
    Complain( "Device " + i_rDevice.m_URN + " does not start with these settings." );
    return ExitFailed;
  }
  return ExitComplete;
}

int CheckTargets( VHostSession& i_rSession, const VRecordOptions& i_rOptions, const std::vector<VDeviceInfo>& i_rDevices )
{
  StageHost::VCaptureTargetOptions Targets;
  Targets.m_Folder = i_rOptions.m_Output;
  Targets.m_bOverwrite = i_rOptions.m_bOverwrite;
  ApplyFormat( i_rOptions.m_Format, Targets );
  Apply( i_rOptions.m_Converter, Targets );
  i_rSession.Host().Targets().Configure( Targets );
  for( const VDeviceInfo& rDevice : i_rDevices )
  {
    const std::string Refusal = i_rSession.Host().Targets().WhyRefused( i_rOptions.m_Name, rDevice.m_URN );
    if( !Refusal.empty() )
    {
      Complain( Refusal );
      return ExitFailed;
    }
  }
  return ExitComplete;
}

StageHost::VRecordingRequest MakeRequest( const VRecordOptions& i_rOptions, const std::vector<VDeviceInfo>& i_rDevices )
{
  StageHost::VRecordingRequest Request;
  for( const VDeviceInfo& rDevice : i_rDevices )
  {
    Request.m_DeviceURNs.push_back( rDevice.m_URN );
  }
  if( i_rOptions.m_Frames != 0 )
  {
    Request.m_Frames = i_rOptions.m_Frames;
  }
  Request.m_Duration = KVZ::VTick::FromSeconds( i_rOptions.m_Seconds );
  Request.m_PreRoll = KVZ::VTick::FromSeconds( i_rOptions.m_PreRoll );
  Request.m_Name = i_rOptions.m_Name;
  return Request;
}

int ExitCodeOf( const std::vector<StageHost::VDeviceOutcome>& i_rOutcomes )
{
  int Code = ExitComplete;
  for( const StageHost::VDeviceOutcome& rOutcome : i_rOutcomes )
  {
    if( rOutcome.HasFailed() )
    {
      return ExitFailed;
    }
    if( rOutcome.m_Lost.Total() != 0 )
    {
      Code = ExitLostFrames;
    }
  }
  return Code;
}

// What each file can hold, told where it is little.
std::vector<VLimitNotice> FindLimits( VHostSession& i_rSession, const VRecordOptions& i_rOptions, const std::vector<VDeviceInfo>& i_rDevices )
{
  std::vector<VLimitNotice> Limits;
  for( const VDeviceInfo& rDevice : i_rDevices )
  {
    const VStoredFormat Format = ReadStoredFormat( i_rSession, rDevice, i_rOptions.m_Format );
    const double FrameSeconds = KVZ::VTick( Format.m_FramePeriod ).Seconds();
    Limits.emplace_back( rDevice.m_URN, FindRunLimit( Format ) );
    const std::string Notice = Limits.back().AtStart(
      i_rOptions.m_Frames != 0 ? static_cast<double>( i_rOptions.m_Frames ) * FrameSeconds : i_rOptions.m_Seconds );
    if( !Notice.empty() )
    {
      Complain( Notice );
    }
  }
  return Limits;
}

int RunRecording( VHostSession& i_rSession, const VRecordOptions& i_rOptions, const std::vector<VDeviceInfo>& i_rDevices )
{
  StageHost::VRecording Recording( i_rSession.Host().Engine(), i_rSession.Host().Targets(), i_rSession.Host().Time() );
  const StageHost::VRecordingRequest Request = MakeRequest( i_rOptions, i_rDevices );
  if( !i_rSession.WaitUntil( ReadySeconds + i_rOptions.m_PreRoll, [&] { return Recording.IsReady( Request ); } ) )
  {
    Complain( IsInterrupted() ? "Interrupted before the recording began." : "The devices deliver no steady signal to record." );
    return IsInterrupted() ? ExitFailed : ExitNoDevice;
  }
  std::string Error;
  if( !Recording.Start( Request, Error ) )
  {
    Complain( Error );
    return ExitFailed;
  }
  VRecordReport Report( i_rOptions.m_Report, i_rDevices, FindLimits( i_rSession, i_rOptions, i_rDevices ) );
  bool bStopped = false;
  for( Recording.Poll(); !Recording.IsFinished(); Recording.Poll() )
  {
    Report.ShowProgress( Recording.GetOutcomes(), i_rSession.Host().Time().Now() );
    if( bStopped )
    {
      WaitAfterInterrupt( PollSeconds );
    }
    else if( !WaitUninterrupted( PollSeconds ) )
    {
      Recording.Stop();
      bStopped = true;
    }
  }
  auto Outcomes = Recording.GetOutcomes();
  ValidateMovies( Outcomes );
  Report.EndProgress();
  return Report.Print( Outcomes ) ? ExitCodeOf( Outcomes ) : ExitFailed;
}

int Run( const VRecordOptions& i_rOptions )
{
  if( ( i_rOptions.m_Frames != 0 ) == ( i_rOptions.m_Seconds > 0.0 ) )
  {
    Complain( "record needs one of --seconds S (above 0) and --frames N (2 or more)." );
    return ExitUsage;
  }
  for( const std::string& rRefusal : { VRecordFormat::WhyRefused( i_rOptions.m_Format ), WhyRefused( i_rOptions.m_Converter ) } )
  {
    if( !rRefusal.empty() )
    {
      Complain( rRefusal );
      return ExitUsage;
    }
  }
  if( const int Result = CheckOutput( i_rOptions ) )
  {
    return Result;
  }
  VHostSession Session;
  if( const int Result = Session.Start( i_rOptions.m_Session ) )
  {
    return Result;
  }
  const std::vector<VDeviceInfo> Devices = Session.WaitForDevices( true );
  if( Devices.empty() )
  {
    return VHostSession::ExitWithoutDevices();
  }
  for( const VDeviceInfo& rDevice : Devices )
  {
    if( const int Result = ApplySettings( Session, i_rOptions, rDevice ) )
    {
      return Result;
    }
  }
  if( const int Result = CheckTargets( Session, i_rOptions, Devices ) )
  {
    return Result;
  }
  return RunRecording( Session, i_rOptions, Devices );
}

}

VCommand AddRecordCommand( CLI::App& io_rApp )
{
  CLI::App& rCommand = *io_rApp.add_subcommand( "record", "Record devices to files" );
  auto pOptions = std::make_shared<VRecordOptions>();
  AddSessionOptions( rCommand, pOptions->m_Session );
  pOptions->m_Session.m_bLeaveOutDisabled = true;
  rCommand.add_option( "--device", pOptions->m_Session.m_DeviceURNs, "A device to record, such as vi:0; all that are enabled when absent" )
    ->type_name( "URN" )
    ->allow_extra_args( false );
  rCommand.add_option( "--seconds", pOptions->m_Seconds, "How long to record" )->type_name( "S" )->check( SecondsCheck() );
  rCommand.add_option( "--frames", pOptions->m_Frames, "How many frames of each device to record" )
    ->type_name( "N" )
    ->check( WholeNumberCheck( 2.0, MostFrames, "a whole number from 2 to 100000000" ) );
  rCommand.add_option( "--pre-roll", pOptions->m_PreRoll, "Begin so many seconds before the request" )
    ->type_name( "S" )
    ->check( NumberCheck( 0.0, LongestPreRoll, "seconds from 0 to 3600" ) );
  AddFormatOptions( rCommand, pOptions->m_Format );
  AddConverterOptions( rCommand, pOptions->m_Converter );
  rCommand.add_option( "--memory", pOptions->m_Session.m_MemoryMiB, "Memory for frames of all devices, in MiB" )
    ->type_name( "MIB" )
    ->check( WholeNumberCheck( static_cast<double>( StageHost::MinimumMemoryMiB ), MostMemoryMiB,
      "whole MiB from " + std::to_string( StageHost::MinimumMemoryMiB ) + " to 1048576" ) )
    ->capture_default_str();
  rCommand.add_option( "--output", pOptions->m_Output, "The folder that the files go to" )->type_name( "DIR" )->required();
  rCommand.add_option( "--name", pOptions->m_Name, "What the file names begin with" )
    ->type_name( "STEM" )
    ->check( []( const std::string& i_rText ) { return i_rText.empty() ? std::string( "a file name cannot begin with nothing" ) : std::string(); } )
    ->capture_default_str();
  rCommand.add_flag( "--overwrite", pOptions->m_bOverwrite, "Replace files that are there" );
  rCommand.add_flag( "--json", pOptions->m_Report.m_bJson, "Print one JSON document" );
  rCommand.add_flag( "--progress", pOptions->m_Report.m_bProgressBlocks, "Print blocks of key=value lines on standard error while recording" );
  return [pOptions] { return Run( *pOptions ); };
}
