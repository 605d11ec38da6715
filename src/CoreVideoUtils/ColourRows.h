// The saturation of pixels, in the processor's widest vectors. No state, any thread.
#pragma once

#include <cstddef>
#include <cstdint>

namespace CoreVideoUtils
{

// Moves each pixel's three channels, in place, to their mean by i_Amount, from -65536 to 1: 0 is as it was, 1 is grey, below 0 away from it.
// Rounded to the nearest byte. i_BytesPerPixel is 3 or 4; a fourth byte stays as it is.
void MoveToMean( float i_Amount, uint8_t* io_pPixels, size_t i_Pixels, size_t i_BytesPerPixel );

namespace Reference
{
// The same, a pixel at a time.
void MoveToMean( float i_Amount, uint8_t* io_pPixels, size_t i_Pixels, size_t i_BytesPerPixel );
}

}
