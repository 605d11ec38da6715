#include "apps/stagehost/RecordReport.h"

#include "Core/VideoInterface/Timecode.h"
#include "Core/VideoInterface/VideoContainer.h"
#include "apps/stagehost/HostSession.h"
#include "apps/stagehost/TextTable.h"

#include <boost/algorithm/string/case_conv.hpp>
#include <boost/filesystem/path.hpp>
#include <nlohmann/json.hpp>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <unistd.h>

using StageCorePluginInterface::VCaptureFileReport;
using StageHost::VDeviceOutcome;

namespace
{

constexpr double ProgressSeconds = 0.25;

const char* StateName( uint32_t i_State )
{
  switch( i_State )
  {
    case 1: return "Idle";
    case 2: return "WaitingForStart";
    case 4: return "Capturing";
    case 16: return "Captured";
    case 32: return "Complete";
    case 64: return "Cancelling";
    case 128: return "Cancelled";
    default: return "Unknown";
  }
}

std::string ContainerWord( const VCaptureFileReport& i_rFile )
{
  return boost::to_lower_copy( KVZ::ToName( static_cast<KVZ::IVideoContainer::Enum>( i_rFile.m_Container ) ) );
}

bool IsSequence( const VCaptureFileReport& i_rFile ) { return i_rFile.m_Container == KVZ::IVideoContainer::EIMAGES; }

// The file, or the folder of an image sequence.
std::string ShownPath( const VCaptureFileReport& i_rFile )
{
  return IsSequence( i_rFile ) ? boost::filesystem::path( i_rFile.m_Path ).parent_path().string() : i_rFile.m_Path;
}

std::vector<std::string> ErrorsOf( const VDeviceOutcome& i_rOutcome )
{
  std::vector<std::string> Errors = i_rOutcome.m_Status.m_Errors;
  for( const VCaptureFileReport& rFile : i_rOutcome.m_Files )
  {
    if( rFile.m_bFailed && std::find( Errors.begin(), Errors.end(), rFile.m_Error ) == Errors.end() )
    {
      Errors.push_back( rFile.m_Error );
    }
  }
  return Errors;
}

// SyncSystem's failure flags, as they cross the interface.
constexpr uint32_t FailureStart = 1;
constexpr uint32_t FailureEndMoved = 2;
constexpr uint32_t FailureMemory = 4;

std::string FramesText( uint64_t i_Frames ) { return std::to_string( i_Frames ) + ( i_Frames == 1 ? " frame" : " frames" ); }

// Why a recording is not all that was asked for, and what helps.
std::vector<std::string> Reasons( const VDeviceOutcome& i_rOutcome )
{
  std::vector<std::string> Texts;
  const uint32_t Failure = i_rOutcome.m_Status.m_Failure;
  const std::string Reached = "after " + std::to_string( i_rOutcome.m_FramesCaptured ) + " of " + FramesText( i_rOutcome.m_FramesRequested );
  if( ( Failure & FailureMemory ) != 0 )
  {
    Texts.push_back( "Memory ran out " + Reached + ": they come faster than the file can be written. A larger --memory bridges a longer time." );
  }
  else if( ( Failure & FailureStart ) != 0 || i_rOutcome.m_Lost.m_Memory != 0 )
  {
    const std::string What = ( Failure & FailureStart ) != 0 ? "The frames asked for are"
                                                             : "The first " + FramesText( i_rOutcome.m_Lost.m_Memory ) + " asked for are";
    Texts.push_back( What + " no longer in memory. A shorter --pre-roll or a larger --memory keeps them." );
  }
  if( i_rOutcome.m_Lost.m_Signal != 0 && ( Failure & FailureStart ) == 0 )
  {
    Texts.push_back( ( ( Failure & FailureEndMoved ) != 0 ? "The signal was interrupted or changed " : "No more frames came " ) + Reached + "." );
  }
  if( i_rOutcome.m_Lost.m_Card != 0 )
  {
    Texts.push_back( "The card missed " + FramesText( i_rOutcome.m_Lost.m_Card ) + " within the recording." );
  }
  return Texts;
}

nlohmann::ordered_json DriftToJson( const VDeviceOutcome& i_rOutcome )
{
  if( !i_rOutcome.m_Timing )
  {
    return nullptr;
  }
  const double Nominal = i_rOutcome.m_Period.Seconds();
  return { { "rate_error_ppm", ( i_rOutcome.m_Timing->m_SecondsPerSample / Nominal - 1.0 ) * 1e6 },
    { "delivery_offset_mean_ms", i_rOutcome.m_Timing->m_MeanOffset * 1e3 },
    { "delivery_offset_deviation_ms", std::sqrt( i_rOutcome.m_Timing->m_OffsetVariance ) * 1e3 } };
}

nlohmann::ordered_json ToJson( const VDeviceOutcome& i_rOutcome, const std::string& i_rName, const VLimitNotice* i_pLimit )
{
  const VCaptureFileReport* const pFile = i_rOutcome.m_Files.empty() ? nullptr : &i_rOutcome.m_Files.front();
  nlohmann::ordered_json Json = { { "urn", i_rOutcome.m_DeviceURN }, { "name", i_rName } };
  Json["container"] = pFile ? nlohmann::ordered_json( ContainerWord( *pFile ) ) : nullptr;
  Json["path"] = pFile ? nlohmann::ordered_json( ShownPath( *pFile ) ) : nullptr;
  Json["frames_requested"] = i_rOutcome.m_FramesRequested;
  Json["frames_captured"] = i_rOutcome.m_FramesCaptured;
  Json["frames_written"] = i_rOutcome.m_FramesWritten;
  Json["bytes"] = pFile ? pFile->m_Bytes : 0;
  Json["lost"] = { { "card", i_rOutcome.m_Lost.m_Card }, { "memory", i_rOutcome.m_Lost.m_Memory }, { "signal", i_rOutcome.m_Lost.m_Signal },
    { "writer", i_rOutcome.m_Lost.m_Writer } };
  Json["state"] = StateName( i_rOutcome.m_Status.m_State );
  Json["failure"] = i_rOutcome.m_Status.m_Failure;
  Json["errors"] = ErrorsOf( i_rOutcome );
  Json["start_timecode"] = pFile && KVZ::IsValid( pFile->m_StartTimecode ) ? nlohmann::ordered_json( KVZ::ToText( pFile->m_StartTimecode ) )
                                                                           : nullptr;
  Json["start_tick"] = i_rOutcome.m_Status.m_Start.IsOpen() ? nlohmann::ordered_json( nullptr )
                                                            : nlohmann::ordered_json( i_rOutcome.m_Status.m_Start.Count() );
  Json["period"] = i_rOutcome.m_Period.Count();
  Json["buffer_peak_fill"] = i_rOutcome.m_PeakFill;
  Json["backlog_peak"] = i_rOutcome.m_PeakBacklog;
  Json["longest_seconds"] = i_pLimit && i_pLimit->IsNear() ? nlohmann::ordered_json( i_pLimit->Seconds() ) : nullptr;
  Json["drift"] = DriftToJson( i_rOutcome );
  return Json;
}

std::string LostText( const StageHost::VLostFrames& i_rLost )
{
  std::vector<std::string> Parts;
  const std::pair<const char*, uint64_t> Causes[] = { { "card", i_rLost.m_Card }, { "memory", i_rLost.m_Memory }, { "signal", i_rLost.m_Signal },
    { "writer", i_rLost.m_Writer } };
  for( const auto& rCause : Causes )
  {
    if( rCause.second != 0 )
    {
      Parts.push_back( std::to_string( rCause.second ) + " by " + rCause.first );
    }
  }
  return Parts.empty() ? "none" : JoinTexts( Parts, ", " );
}

bool WantsPlainOutput()
{
  const char* const pNoColor = std::getenv( "NO_COLOR" );
  return pNoColor && *pNoColor;
}

}

VRecordReport::VRecordReport( const VReportOptions& i_rOptions, const std::vector<StageHost::VDeviceInfo>& i_rDevices,
  std::vector<VLimitNotice> i_Limits )
  : m_Options( i_rOptions ), m_Devices( i_rDevices ), m_Limits( std::move( i_Limits ) ), m_bTerminal( isatty( STDERR_FILENO ) != 0 )
{
}

std::string VRecordReport::NameOf( const std::string& i_rURN ) const
{
  const auto Found = std::find_if( m_Devices.begin(), m_Devices.end(),
    [&]( const StageHost::VDeviceInfo& i_rDevice ) { return i_rDevice.m_URN == i_rURN; } );
  return Found == m_Devices.end() ? std::string() : Found->m_Name;
}

const VLimitNotice* VRecordReport::LimitOf( const std::string& i_rURN ) const
{
  const auto Found = std::find_if( m_Limits.begin(), m_Limits.end(), [&]( const VLimitNotice& i_rLimit ) { return i_rLimit.DeviceURN() == i_rURN; } );
  return Found == m_Limits.end() ? nullptr : &*Found;
}

void VRecordReport::WarnOfLimits( const std::vector<VDeviceOutcome>& i_rOutcomes )
{
  for( VLimitNotice& rLimit : m_Limits )
  {
    const auto Outcome = std::find_if( i_rOutcomes.begin(), i_rOutcomes.end(),
      [&]( const VDeviceOutcome& i_rOutcome ) { return i_rOutcome.m_DeviceURN == rLimit.DeviceURN(); } );
    const std::string Warning = Outcome == i_rOutcomes.end()
      ? std::string()
      : rLimit.After( static_cast<double>( Outcome->m_FramesCaptured ) * Outcome->m_Period.Seconds() );
    if( !Warning.empty() )
    {
      Complain( Warning );
    }
  }
}

void VRecordReport::ShowProgress( const std::vector<VDeviceOutcome>& i_rOutcomes, double i_Now )
{
  WarnOfLimits( i_rOutcomes );
  if( i_Now < m_NextProgress || ( !m_Options.m_bProgressBlocks && !m_bTerminal ) )
  {
    return;
  }
  m_NextProgress = i_Now + ProgressSeconds;
  if( m_Options.m_bProgressBlocks )
  {
    for( const VDeviceOutcome& rOutcome : i_rOutcomes )
    {
      std::fprintf( stderr, "urn=%s\nstate=%s\nframes_captured=%llu\nframes_requested=%llu\nbuffer_fill=%.3f\nprogress=continue\n\n",
        rOutcome.m_DeviceURN.c_str(), StateName( rOutcome.m_Status.m_State ), static_cast<unsigned long long>( rOutcome.m_FramesCaptured ),
        static_cast<unsigned long long>( rOutcome.m_FramesRequested ), rOutcome.m_Status.m_BufferFill );
    }
    return;
  }
  std::string Line;
  for( const VDeviceOutcome& rOutcome : i_rOutcomes )
  {
    char Part[128];
    std::snprintf( Part, sizeof( Part ), "  %s %llu/%llu frames", rOutcome.m_DeviceURN.c_str(),
      static_cast<unsigned long long>( rOutcome.m_FramesCaptured ), static_cast<unsigned long long>( rOutcome.m_FramesRequested ) );
    Line += Part;
  }
  std::fprintf( stderr, WantsPlainOutput() ? "\rrec%s   " : "\r\x1b[31mrec\x1b[0m%s\x1b[K", Line.c_str() );
  m_bLineOpen = true;
}

void VRecordReport::EndProgress()
{
  if( m_bLineOpen )
  {
    std::fputs( "\n", stderr );
  }
  if( m_Options.m_bProgressBlocks )
  {
    std::fputs( "progress=end\n", stderr );
  }
}

void VRecordReport::PrintText( const VDeviceOutcome& i_rOutcome ) const
{
  std::cout << i_rOutcome.m_DeviceURN << "  " << NameOf( i_rOutcome.m_DeviceURN ) << "\n";
  for( const VCaptureFileReport& rFile : i_rOutcome.m_Files )
  {
    std::cout << ( IsSequence( rFile ) ? "  images    " : "  file      " ) << ShownPath( rFile ) << "  (" << BytesToText( rFile.m_Bytes ) << ")\n";
    if( KVZ::IsValid( rFile.m_StartTimecode ) )
    {
      std::cout << "  start     " << KVZ::ToText( rFile.m_StartTimecode ) << "\n";
    }
  }
  char Rate[64];
  std::snprintf( Rate, sizeof( Rate ), "%.2f", 1.0 / i_rOutcome.m_Period.Seconds() );
  std::cout << "  frames    " << i_rOutcome.m_FramesWritten << " of " << i_rOutcome.m_FramesRequested << " written, " << Rate << " a second\n"
            << "  lost      " << LostText( i_rOutcome.m_Lost ) << "\n"
            << "  backlog   " << i_rOutcome.m_PeakBacklog << " frames at most\n"
            << "  state     " << StateName( i_rOutcome.m_Status.m_State ) << "\n";
}

bool VRecordReport::Print( const std::vector<VDeviceOutcome>& i_rOutcomes ) const
{
  nlohmann::ordered_json List = nlohmann::ordered_json::array();
  for( const VDeviceOutcome& rOutcome : i_rOutcomes )
  {
    if( m_Options.m_bJson )
    {
      List.push_back( ToJson( rOutcome, NameOf( rOutcome.m_DeviceURN ), LimitOf( rOutcome.m_DeviceURN ) ) );
    }
    else
    {
      PrintText( rOutcome );
    }
    for( const std::vector<std::string>& rTexts : { ErrorsOf( rOutcome ), Reasons( rOutcome ) } )
    {
      for( const std::string& rText : rTexts )
      {
        Complain( rOutcome.m_DeviceURN + ": " + rText );
      }
    }
  }
  if( m_Options.m_bJson )
  {
    std::cout << List.dump( 2, ' ', false, nlohmann::ordered_json::error_handler_t::replace ) << "\n";
  }
  return static_cast<bool>( std::cout.flush() );
}
