// The ancillary data of a frame as this library's buffers hold it, and its decoder. The vendor's own stream is not public: only decoders are
// offered, so this one may look as it likes.
#pragma once

#include "VendorInterfaces/BlueVelvet.h"
#include "cards/common/SignalTimeline.h"
#include "cards/common/Sound.h"

#include <cstdint>

namespace VirtualCards
{

// A timecode label as the decoder gives it: a BCD digit in the low nibbles of each pair of bytes, flags beside the tens, user bits, of which the
// signal has none, in the high nibbles.
uint64_t TimecodeWord( const VSignalTimecode& i_rTimecode );

// Fills BlueVelvet::HancBytes. RP188 packets are in every signal that carries timecode, VITC and LTC; only standard definition has VITC lines,
// and nothing is plugged into the external input.
void EncodeHanc( const VSignalFrame& i_rSignal, const VSound& i_rSound, uint8_t* o_pHanc );

// False for memory that holds no ancillary data and for a record that asks for the impossible. Timecodes that the signal does not carry are left
// as they are.
bool DecodeHanc( const uint8_t* i_pHanc, BlueVelvet::VHancDecodeRecord& io_rRecord );

}
