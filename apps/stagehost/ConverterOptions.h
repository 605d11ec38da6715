// What "record" says about the conversion of pixels: who does it, and the lens whose distortion it undoes.
#pragma once

#include "apps/stagehost/RecordFormat.h"
#include "host/CaptureTargets.h"
#include "host/DeviceSettings.h"

#include <string>
#include <vector>

namespace CLI
{
class App;
}

struct VConverterOptions
{
  std::string m_Converter;      // empty: the module's choice, or with a lens OpenGL where it is needed
  std::vector<double> m_Lens;   // centre in pixels, k1, k2, and k3 where there is one; empty for none
};

void AddConverterOptions( CLI::App& io_rCommand, VConverterOptions& io_rOptions );

// Why this cannot be recorded, whatever the device: one line that names what would be accepted. Empty where nothing is wrong.
std::string WhyRefused( const VConverterOptions& i_rOptions );
// The same for one device and what is recorded of it.
std::string WhyRefused( const VConverterOptions& i_rOptions, const VFormatOptions& i_rFormat, const StageHost::VDeviceInfo& i_rDevice );

void Apply( const VConverterOptions& i_rOptions, StageHost::VCaptureTargetOptions& o_rTargets );
