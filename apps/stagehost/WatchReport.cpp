#include "apps/stagehost/WatchReport.h"

#include "Core/VideoInterface/Timecode.h"
#include "apps/stagehost/TextTable.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <iostream>
#include <sys/ioctl.h>
#include <unistd.h>

namespace
{

std::string Text( const char* i_pFormat, double i_Number )
{
  char Buffer[48];
  std::snprintf( Buffer, sizeof( Buffer ), i_pFormat, i_Number );
  return Buffer;
}

std::string Pair( const char* i_pFormat, double i_First, double i_Second )
{
  char Buffer[96];
  std::snprintf( Buffer, sizeof( Buffer ), i_pFormat, i_First, i_Second );
  return Buffer;
}

std::string TableText( const std::vector<VWatchedDevice>& i_rDevices )
{
  VTextTable Table( { "URN", "NAME", "STANDARD", "TIMECODE", "STATES", "FPS", "LATENCY ms (p99)", "DROPPED", "LOST", "BUFFER", "DRIFT ms" } );
  for( const VWatchedDevice& rDevice : i_rDevices )
  {
    const StageHost::VWatchFigures& rFigures = rDevice.m_Figures;
    const bool bStates = rFigures.m_States != 0;
    const auto& rTiming = rDevice.m_Timing;
    Table.AddRow( { rDevice.m_URN, rDevice.m_Name, rDevice.m_Standard == "Unspecified" ? "no signal" : rDevice.m_Standard,
      bStates ? KVZ::ToText( rFigures.m_Timecode ) : "-", std::to_string( rFigures.m_States ),
      bStates ? Text( "%.2f", rFigures.m_StatesPerSecond ) : "-",
      bStates ? Pair( "%.2f (%.2f)", rFigures.m_MedianLatency * 1e3, rFigures.m_Latency99 * 1e3 ) : "-", std::to_string( rFigures.m_DroppedFrames ),
      std::to_string( rDevice.m_CardDropped + rFigures.m_MissedFrames ), Text( "%.0f %%", rDevice.m_BufferFill * 100.0 ),
      rTiming ? Pair( "%.2f +- %.2f", rTiming->m_MeanOffset * 1e3, std::sqrt( rTiming->m_OffsetVariance ) * 1e3 ) : "-" } );
  }
  return Table.ToText();
}

// Lines that do not fit would wrap, and take more room than they are counted for.
std::string ClipLines( const std::string& i_rText )
{
  winsize Size = {};
  const size_t Width = ioctl( STDERR_FILENO, TIOCGWINSZ, &Size ) == 0 && Size.ws_col != 0 ? Size.ws_col : std::string::npos;
  std::string Clipped;
  for( size_t Begin = 0; Begin < i_rText.size(); )
  {
    const size_t End = std::min( i_rText.find( '\n', Begin ), i_rText.size() );
    Clipped += i_rText.substr( Begin, std::min( End - Begin, Width ) ) + "\n";
    Begin = End + 1;
  }
  return Clipped;
}

nlohmann::ordered_json ToJson( const VWatchedDevice& i_rDevice )
{
  const StageHost::VWatchFigures& rFigures = i_rDevice.m_Figures;
  nlohmann::ordered_json Json = { { "urn", i_rDevice.m_URN }, { "name", i_rDevice.m_Name }, { "standard", i_rDevice.m_Standard } };
  Json["signal"] = i_rDevice.m_Standard != "Unspecified";
  Json["timecode"] = KVZ::IsValid( rFigures.m_Timecode ) ? nlohmann::ordered_json( KVZ::ToText( rFigures.m_Timecode ) ) : nullptr;
  Json["width"] = rFigures.m_Video.m_ImageWidth;
  Json["height"] = rFigures.m_Video.m_ImageHeight;
  Json["pixel_format"] = KVZ::ToName( rFigures.m_Video.m_PixelFormat );
  Json["period"] = rFigures.m_Period.Count();
  Json["states"] = rFigures.m_States;
  Json["states_per_second"] = rFigures.m_StatesPerSecond;
  Json["latency_median_ms"] = rFigures.m_MedianLatency * 1e3;
  Json["latency_p99_ms"] = rFigures.m_Latency99 * 1e3;
  Json["dropped"] = rFigures.m_DroppedFrames;
  Json["drop_runs"] = rFigures.m_DropRuns;
  Json["missed"] = rFigures.m_MissedFrames;
  Json["card_dropped"] = i_rDevice.m_CardDropped;
  Json["sessions"] = rFigures.m_Sessions;
  Json["wake_ups"] = i_rDevice.m_Source.m_WakeUps;
  Json["buffer_fill"] = i_rDevice.m_BufferFill;
  Json["drift"] = nullptr;
  if( i_rDevice.m_Timing )
  {
    Json["drift"] = { { "delivery_offset_mean_ms", i_rDevice.m_Timing->m_MeanOffset * 1e3 },
      { "delivery_offset_deviation_ms", std::sqrt( i_rDevice.m_Timing->m_OffsetVariance ) * 1e3 } };
  }
  Json["faults"] = rFigures.m_Faults;
  Json["first_fault"] = rFigures.m_Faults != 0 ? nlohmann::ordered_json( rFigures.m_FirstFault ) : nullptr;
  return Json;
}

}

VWatchReport::VWatchReport( bool i_bJson ) : m_bJson( i_bJson ), m_bTerminal( isatty( STDERR_FILENO ) != 0 ) {}

void VWatchReport::Refresh( const std::vector<VWatchedDevice>& i_rDevices )
{
  if( !m_bTerminal )
  {
    return;
  }
  // Up to the first line of the last one, and clear from there on.
  std::string Drawing = m_Lines != 0 ? "\x1b[" + std::to_string( m_Lines ) + "A\x1b[J" : std::string();
  const std::string Table = ClipLines( TableText( i_rDevices ) );
  m_Lines = static_cast<size_t>( std::count( Table.begin(), Table.end(), '\n' ) );
  Drawing += Table;
  std::fputs( Drawing.c_str(), stderr );
}

bool VWatchReport::Print( const std::vector<VWatchedDevice>& i_rDevices )
{
  if( m_bTerminal && m_Lines != 0 )
  {
    std::fprintf( stderr, "\x1b[%zuA\x1b[J", m_Lines );
    m_Lines = 0;
  }
  if( m_bJson )
  {
    nlohmann::ordered_json List = nlohmann::ordered_json::array();
    for( const VWatchedDevice& rDevice : i_rDevices )
    {
      List.push_back( ToJson( rDevice ) );
    }
    std::cout << List.dump( 2, ' ', false, nlohmann::ordered_json::error_handler_t::replace ) << "\n";
  }
  else
  {
    std::cout << TableText( i_rDevices );
  }
  return static_cast<bool>( std::cout.flush() );
}
