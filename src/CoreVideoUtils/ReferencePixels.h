// The arithmetic of all conversions, a pixel at a time: what PixelRows.h has to give, to the bit. Rows as described there.
#pragma once

#include "CoreVideoUtils/PixelRows.h"

namespace CoreVideoUtils::Reference
{

bool ConvertRow( VRowFormats i_Formats, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels );

bool DemosaicRow( const std::array<const uint8_t*, 5>& i_rRows, VBayerRow i_Row, KVZ::IPixelFormat::Enum i_Target, uint8_t* o_pTarget,
  size_t i_Pixels );

void FilterBayerRow( const std::array<const uint8_t*, 3>& i_rRows, VBayerRow i_Row, uint8_t* o_pTarget, size_t i_Pixels );

}
