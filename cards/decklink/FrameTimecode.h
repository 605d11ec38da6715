// The timecode of a frame, as the different places of a signal carry it.
#pragma once

#include "VendorInterfaces/DeckLinkAPI.h"
#include "cards/common/SignalTimeline.h"

namespace VirtualCards
{

// S_OK with one reference for the caller; S_FALSE and a null pointer where the signal has no timecode in this place; E_INVALIDARG for
// no known place. RP188 packets are in every signal that carries timecode: LTC and VITC1 always, VITC2 with the second field of an
// interlaced frame. Only standard definition has VITC lines. No deck hangs on the serial port.
DeckLinkAPI::HRESULT GetFrameTimecode( const VSignalFrame& i_rSignal, uint32_t i_Format, DeckLinkAPI::IDeckLinkTimecode** o_ppTimecode );

}
