// Gamma and saturation of a colour image, in place. A plain value: copy it to work with settings that others may change.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"

#include <array>
#include <cstddef>
#include <cstdint>

namespace CoreVideoUtils
{

class VColourCorrector
{
public:
  // A saturation and gamma of 1 each change nothing. The table is computed only for a gamma that is neither 1 nor the one in force.
  void SetColourCorrection( const KVZ::VColourRecord& i_rColour );

  bool IsNeutral() const { return m_Gamma == 1.0f && m_SaturationOffset == 0.0f; }

  // First each channel goes through pow( c, 1 / gamma ), c in 0 to 1; then it moves to or away from the pixel's mean by the saturation.
  // Results are rounded to the nearest byte. i_BytesPerPixel is 3 or 4; a fourth byte stays as it is.
  void Apply( uint8_t* io_pPixels, size_t i_Pixels, size_t i_BytesPerPixel ) const;

private:
  float m_Gamma = 1.0f;
  float m_SaturationOffset = 0.0f;   // the record's saturation less 1
  std::array<uint8_t, 256> m_Table{};
};

}
