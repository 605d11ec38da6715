// stagehost devices: what cards there are and what comes into them.
#include "apps/stagehost/Commands.h"
#include "apps/stagehost/ExitCode.h"
#include "apps/stagehost/HostSession.h"
#include "apps/stagehost/TextTable.h"

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <cstdlib>
#include <iostream>

using StageHost::VDeviceInfo;

namespace
{

struct VDevicesOptions
{
  VSessionOptions m_Session;
  bool m_bJson = false;
};

nlohmann::ordered_json ToNumber( const std::string& i_rText ) { return nlohmann::ordered_json( std::strtoul( i_rText.c_str(), nullptr, 10 ) ); }

nlohmann::ordered_json ToJson( const VDeviceInfo& i_rDevice )
{
  nlohmann::ordered_json ChannelCounts = nlohmann::ordered_json::array();
  for( const std::string& rCount : i_rDevice.m_AudioChannelCounts )
  {
    ChannelCounts.push_back( ToNumber( rCount ) );
  }
  return { { "urn", i_rDevice.m_URN }, { "name", i_rDevice.m_Name }, { "driver", i_rDevice.m_Driver }, { "standard", i_rDevice.m_Standard },
    { "signal", i_rDevice.HasSignal() }, { "status", i_rDevice.m_Status }, { "timecode", i_rDevice.m_Timecode },
    { "pixel_format", i_rDevice.m_PixelFormat }, { "pixel_formats", i_rDevice.m_PixelFormats }, { "audio_format", i_rDevice.m_AudioFormat },
    { "channels", ToNumber( i_rDevice.m_AudioChannels ) }, { "channel_counts", ChannelCounts }, { "warnings", i_rDevice.m_Warnings } };
}

void PrintTable( const std::vector<VDeviceInfo>& i_rDevices )
{
  VTextTable Table( { "URN", "NAME", "DRIVER", "STANDARD", "SIGNAL", "TIMECODE", "PIXEL FORMATS", "CHANNELS" } );
  for( const VDeviceInfo& rDevice : i_rDevices )
  {
    Table.AddRow(
      { rDevice.m_URN, rDevice.m_Name, rDevice.m_Driver, rDevice.HasSignal() ? rDevice.m_Standard : "-", rDevice.HasSignal() ? "yes" : "no",
        rDevice.m_Timecode, JoinTexts( rDevice.m_PixelFormats, " " ), JoinTexts( rDevice.m_AudioChannelCounts, " " ) } );
  }
  std::cout << Table.ToText();
  for( const VDeviceInfo& rDevice : i_rDevices )
  {
    for( const std::string& rWarning : rDevice.m_Warnings )
    {
      std::cerr << rDevice.m_URN << ": " << rWarning << "\n";
    }
  }
}

int Run( const VDevicesOptions& i_rOptions )
{
  VHostSession Session;
  if( const int Result = Session.Start( i_rOptions.m_Session ) )
  {
    return Result;
  }
  std::vector<VDeviceInfo> Devices = Session.WaitForDevices( false );
  if( Devices.empty() )
  {
    return VHostSession::ExitWithoutDevices();
  }
  Session.WaitForDelivery( Devices );
  Devices = Session.Settings().GetDevices();
  if( i_rOptions.m_bJson )
  {
    nlohmann::ordered_json List = nlohmann::ordered_json::array();
    for( const VDeviceInfo& rDevice : Devices )
    {
      List.push_back( ToJson( rDevice ) );
    }
    std::cout << List.dump( 2, ' ', false, nlohmann::ordered_json::error_handler_t::replace ) << "\n";
  }
  else
  {
    PrintTable( Devices );
  }
  return std::cout.flush() ? ExitComplete : ExitFailed;
}

}

VCommand AddDevicesCommand( CLI::App& io_rApp )
{
  CLI::App& rCommand = *io_rApp.add_subcommand( "devices", "List the capture devices and what comes into them" );
  auto pOptions = std::make_shared<VDevicesOptions>();
  AddSessionOptions( rCommand, pOptions->m_Session );
  rCommand.add_flag( "--json", pOptions->m_bJson, "Print one JSON document" );
  return [pOptions] { return Run( *pOptions ); };
}
