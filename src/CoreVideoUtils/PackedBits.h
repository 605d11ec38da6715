// Pixels of 7 or 6 bits, back to back without padding, the highest bit first. No state, any thread.
#pragma once

#include <cstddef>
#include <cstdint>

namespace CoreVideoUtils
{

// i_Bits is 7 or 6. Keeps that many high bits of each byte. Writes i_Pixels * i_Bits bits, rounded up to bytes; the bits left over are 0.
void PackBits( size_t i_Bits, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels );

// Back to the top of a byte each, low bits 0.
void UnpackBits( size_t i_Bits, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels );

}
