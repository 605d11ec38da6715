// stagehost inspect: what a tvid file holds, finished or not.
#include "Core/VideoInterface/Timecode.h"
#include "FileIO/TarvoVideo/Reader.h"
#include "apps/stagehost/Commands.h"
#include "apps/stagehost/ExitCode.h"
#include "apps/stagehost/HostSession.h"
#include "apps/stagehost/Interrupt.h"
#include "apps/stagehost/TextTable.h"

#include <CLI/CLI.hpp>
#include <boost/crc.hpp>
#include <boost/filesystem/operations.hpp>
#include <nlohmann/json.hpp>

#include <cmath>
#include <cstdio>
#include <iostream>

using TarvoVideo::VFrameRecord;
using TarvoVideo::VReader;

namespace
{

struct VInspectOptions
{
  std::string m_Path;
  bool m_bFrames = false;
  bool m_bJson = false;
};

// A value of an attribute as JSON, whichever of the twelve types it has.
nlohmann::ordered_json ValueOf( const KVZ::IVideoAttributes& i_rAttributes, const std::string& i_rKey )
{
  nlohmann::ordered_json Json;
  const auto Try = [&]( auto i_Value )
  {
    if( !i_rAttributes.Get( i_rKey, i_Value ) )
    {
      return false;
    }
    if constexpr( std::is_same_v<decltype( i_Value ), char> )
    {
      Json = static_cast<int>( i_Value );
    }
    else
    {
      Json = i_Value;
    }
    return true;
  };
  (void)( Try( false ) || Try( char() ) || Try( int16_t() ) || Try( int32_t() ) || Try( int64_t() ) || Try( uint8_t() ) || Try( uint16_t() ) ||
    Try( uint32_t() ) || Try( uint64_t() ) || Try( float() ) || Try( double() ) || Try( std::string() ) );
  return Json;
}

nlohmann::ordered_json ToJson( const KVZ::IVideoAttributes& i_rAttributes )
{
  nlohmann::ordered_json Json = nlohmann::ordered_json::object();
  for( const auto& rEntry : i_rAttributes.Values() )
  {
    Json[rEntry.first] = ValueOf( i_rAttributes, rEntry.first );
  }
  return Json;
}

struct VFrameRow
{
  VFrameRecord m_Record;
  uint32_t m_VideoCrc = 0;
  uint32_t m_AudioCrc = 0;
};

bool Checksum( VReader& io_rReader, const TarvoVideo::VExtent& i_rExtent, uint32_t& o_rCrc )
{
  boost::crc_32_type Crc;
  const bool bRead = io_rReader.Read( i_rExtent, [&]( const uint8_t* i_pData, size_t i_Size ) { Crc.process_bytes( i_pData, i_Size ); } );
  o_rCrc = static_cast<uint32_t>( Crc.checksum() );
  return bRead;
}

std::string Hex( uint32_t i_Value )
{
  char Text[16];
  std::snprintf( Text, sizeof( Text ), "%08x", i_Value );
  return Text;
}

std::string StartTimecode( const VReader& i_rReader )
{
  KVZ::ITimecode Timecode;
  return KVZ::ReadAttributes( Timecode, i_rReader.GetExternalAttributes() ) && KVZ::IsValid( Timecode ) ? KVZ::ToText( Timecode ) : std::string();
}

std::string RateText( const VReader& i_rReader )
{
  KVZ::VTimingRecord Timing;
  if( !Timing.ReadAttributes( i_rReader.GetExternalAttributes() ) || Timing.m_FramePeriodInTicks == 0 )
  {
    return {};
  }
  char Text[64];
  std::snprintf( Text, sizeof( Text ), ", %.3f frames a second", static_cast<double>( Timing.m_TicksPerSecond ) / Timing.m_FramePeriodInTicks );
  return Text;
}

std::string AudioText( const KVZ::AudioFrameInfo& i_rAudio )
{
  return i_rAudio.HasAudio() ? KVZ::ToName( i_rAudio.m_SampleFormat ) + ", " + std::to_string( i_rAudio.m_SampleRate ) + " Hz, " +
      std::to_string( i_rAudio.m_Channels ) + " channels"
                             : "none";
}

// The head of the report. False with an error in the reader.
bool PrintSummary( VReader& io_rReader, const VInspectOptions& i_rOptions )
{
  uint64_t Frames = 0;
  if( !io_rReader.CountFrames( Frames ) )
  {
    return false;
  }
  const KVZ::VideoFrameInfo& rVideo = io_rReader.GetVideoInfo();
  std::cout << "file        " << i_rOptions.m_Path << "  (" << BytesToText( io_rReader.GetFileSize() ) << ")\n"
            << "finished    " << ( io_rReader.IsFinished() ? "yes" : "no: it was never closed; these are the whole frame records found in it" )
            << "\n"
            << "frames      " << Frames << RateText( io_rReader ) << "\n"
            << "video       " << rVideo.m_ImageWidth << " x " << rVideo.m_ImageHeight << ", " << KVZ::ToName( rVideo.m_PixelFormat ) << "\n"
            << "audio       " << AudioText( io_rReader.GetAudioInfo() ) << "\n";
  const std::string Timecode = StartTimecode( io_rReader );
  std::cout << "start       " << ( Timecode.empty() ? "no timecode" : Timecode ) << "\n\n";
  VTextTable Table( { "ATTRIBUTE", "VALUE" } );
  for( const KVZ::IVideoAttributes* pBlock : { &io_rReader.GetInternalAttributes(), &io_rReader.GetExternalAttributes() } )
  {
    const nlohmann::ordered_json Values = ToJson( *pBlock );
    for( const auto& rEntry : Values.items() )
    {
      Table.AddRow( { rEntry.key(), rEntry.value().is_string() ? rEntry.value().get<std::string>() : rEntry.value().dump() } );
    }
  }
  std::cout << Table.ToText();
  return true;
}

bool ReadRow( VReader& io_rReader, VFrameRow& o_rRow )
{
  return io_rReader.Next( o_rRow.m_Record ) && Checksum( io_rReader, o_rRow.m_Record.m_Video, o_rRow.m_VideoCrc ) &&
    Checksum( io_rReader, o_rRow.m_Record.m_Audio, o_rRow.m_AudioCrc );
}

void PrintRows( VReader& io_rReader )
{
  std::cout << "\n       KEY       POSITION  VIDEO BYTES VIDEO CRC  AUDIO BYTES AUDIO CRC\n";
  VFrameRow Row;
  while( !IsInterrupted() && ReadRow( io_rReader, Row ) )
  {
    char Line[128];
    std::snprintf( Line, sizeof( Line ), "%10llu %14llu %12llu  %08x %12llu  %08x\n", static_cast<unsigned long long>( Row.m_Record.m_Key ),
      static_cast<unsigned long long>( Row.m_Record.m_Video.m_Position ), static_cast<unsigned long long>( Row.m_Record.m_Video.m_Size ),
      Row.m_VideoCrc, static_cast<unsigned long long>( Row.m_Record.m_Audio.m_Size ), Row.m_AudioCrc );
    std::cout << Line;
  }
}

bool PrintJson( VReader& io_rReader, const VInspectOptions& i_rOptions )
{
  uint64_t Frames = 0;
  if( !io_rReader.CountFrames( Frames ) )
  {
    return false;
  }
  nlohmann::ordered_json Json = { { "path", i_rOptions.m_Path }, { "bytes", io_rReader.GetFileSize() }, { "finished", io_rReader.IsFinished() },
    { "frame_count", Frames }, { "internal", ToJson( io_rReader.GetInternalAttributes() ) },
    { "external", ToJson( io_rReader.GetExternalAttributes() ) } };
  const std::string Timecode = StartTimecode( io_rReader );
  Json["start_timecode"] = Timecode.empty() ? nlohmann::ordered_json( nullptr ) : nlohmann::ordered_json( Timecode );
  if( i_rOptions.m_bFrames )
  {
    nlohmann::ordered_json List = nlohmann::ordered_json::array();
    VFrameRow Row;
    while( !IsInterrupted() && ReadRow( io_rReader, Row ) )
    {
      List.push_back(
        { { "key", Row.m_Record.m_Key }, { "position", Row.m_Record.m_Video.m_Position }, { "video_bytes", Row.m_Record.m_Video.m_Size },
          { "video_crc32", Hex( Row.m_VideoCrc ) }, { "audio_bytes", Row.m_Record.m_Audio.m_Size }, { "audio_crc32", Hex( Row.m_AudioCrc ) } } );
    }
    Json["frames"] = std::move( List );
  }
  std::cout << Json.dump( 2, ' ', false, nlohmann::ordered_json::error_handler_t::replace ) << "\n";
  return true;
}

// Empty where there is a file to open.
std::string WhyNoFile( const std::string& i_rPath )
{
  boost::system::error_code Error;
  const boost::filesystem::file_status Status = boost::filesystem::status( i_rPath, Error );
  if( !boost::filesystem::exists( Status ) )
  {
    return Error ? Error.message() + "." : "There is no such file.";
  }
  return boost::filesystem::is_regular_file( Status ) ? std::string() : "This is no file.";
}

int Run( const VInspectOptions& i_rOptions )
{
  const std::string WhyNot = WhyNoFile( i_rOptions.m_Path );
  if( !WhyNot.empty() )
  {
    Complain( i_rOptions.m_Path + ": " + WhyNot );
    return ExitFailed;
  }
  VReader Reader;
  if( Reader.Open( i_rOptions.m_Path ) )
  {
    const bool bPrinted = i_rOptions.m_bJson ? PrintJson( Reader, i_rOptions ) : PrintSummary( Reader, i_rOptions );
    if( bPrinted && i_rOptions.m_bFrames && !i_rOptions.m_bJson )
    {
      PrintRows( Reader );
    }
  }
  std::cout.flush();
  if( !Reader.GetError().empty() )
  {
    Complain( i_rOptions.m_Path + ": " + Reader.GetError() );
    return ExitFailed;
  }
  return std::cout.good() && !IsInterrupted() ? ExitComplete : ExitFailed;
}

}

VCommand AddInspectCommand( CLI::App& io_rApp )
{
  CLI::App& rCommand = *io_rApp.add_subcommand( "inspect", "Show what a tvid file holds" );
  auto pOptions = std::make_shared<VInspectOptions>();
  rCommand.add_option( "FILE", pOptions->m_Path, "A .tvid file" )->required();
  rCommand.add_flag( "--frames", pOptions->m_bFrames, "Add a row for each frame, with CRC-32 of video and audio" );
  rCommand.add_flag( "--json", pOptions->m_bJson, "Print one JSON document" );
  return [pOptions] { return Run( *pOptions ); };
}
