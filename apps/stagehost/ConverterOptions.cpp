#include "apps/stagehost/ConverterOptions.h"

#include "apps/stagehost/TextTable.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <array>

namespace
{

struct VConverterWord
{
  const char* m_pWord;
  int32_t m_Converter;   // as StageCorePluginInterface::VCaptureTarget has it
};
constexpr std::array Converters = { VConverterWord{ "opengl", 1 }, VConverterWord{ "software", 2 }, VConverterWord{ "auto", 3 } };

// What OpenGL can read back.
constexpr std::array LensFormats = { "Luminance8", "R8G8B8", "B8G8R8", "R8G8B8u8", "B8G8R8u8" };

std::vector<std::string> ConverterWords()
{
  std::vector<std::string> Words;
  for( const VConverterWord& rRow : Converters )
  {
    Words.push_back( rRow.m_pWord );
  }
  return Words;
}

}

void AddConverterOptions( CLI::App& io_rCommand, VConverterOptions& io_rOptions )
{
  io_rCommand
    .add_option( "--converter", io_rOptions.m_Converter,
      "What converts pixel formats: software, opengl, or auto for OpenGL where it alone can (default: software, with --lens auto)" )
    ->check( CLI::IsMember( ConverterWords() ) );
  io_rCommand.add_option( "--lens", io_rOptions.m_Lens, "The lens whose distortion is undone: its centre in pixels, and its parameters for pixels" )
    ->type_name( "CX,CY,K1,K2[,K3]" )
    ->delimiter( ',' )
    ->expected( 4, 5 );
}

std::string WhyRefused( const VConverterOptions& i_rOptions )
{
  return !i_rOptions.m_Lens.empty() && i_rOptions.m_Converter == "software" ? "--lens: --converter software undoes no lens; opengl and auto do." : "";
}

std::string WhyRefused( const VConverterOptions& i_rOptions, const VFormatOptions& i_rFormat, const StageHost::VDeviceInfo& i_rDevice )
{
  const bool bUncompressed = i_rFormat.m_Video.empty() ? i_rDevice.m_VideoPayload == "Uncompressed" : i_rFormat.m_Video == "uncompressed";
  const std::string& rStored = i_rFormat.m_PixelFormat.empty() ? i_rDevice.m_PixelFormat : i_rFormat.m_PixelFormat;
  if( i_rOptions.m_Lens.empty() || !bUncompressed || std::count( LensFormats.begin(), LensFormats.end(), rStored ) > 0 )
  {
    return {};
  }
  return "--lens: uncompressed video of " + i_rDevice.m_URN + " needs --pixel-format " +
    JoinTexts( { LensFormats.begin(), LensFormats.end() }, ", " ) + ".";
}

void Apply( const VConverterOptions& i_rOptions, StageHost::VCaptureTargetOptions& o_rTargets )
{
  const std::string Word = i_rOptions.m_Converter.empty() && !i_rOptions.m_Lens.empty() ? "auto" : i_rOptions.m_Converter;
  for( const VConverterWord& rRow : Converters )
  {
    if( Word == rRow.m_pWord )
    {
      o_rTargets.m_Converter = rRow.m_Converter;
    }
  }
  const std::vector<double>& rLens = i_rOptions.m_Lens;
  if( rLens.empty() )
  {
    return;
  }
  using VRecord = KVZ::VLensDistortionRecord;
  o_rTargets.m_bCorrectLens = true;
  o_rTargets.m_Lens.m_RadialModel = rLens.size() == 5 ? VRecord::ETarvo3Parameter : VRecord::ETarvo2Parameter;
  o_rTargets.m_Lens.m_Centre = { rLens[0], rLens[1] };
  o_rTargets.m_Lens.m_Parameters = { rLens[2], rLens[3], rLens.size() == 5 ? rLens[4] : 0.0 };
}
