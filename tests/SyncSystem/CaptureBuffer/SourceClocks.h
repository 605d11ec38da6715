// The clocks of a source under test.
#pragma once

#include "SyncSystem/Clock.h"

inline const KVZ::IClock Counter( KVZ::IClock::CounterFromSessionStart, 0, 77 );
inline const KVZ::IClock FrameNumber( KVZ::IClock::FrameNumber, 0, 77 );
inline const KVZ::IClock Timecode( KVZ::IClock::Timecode, 3, 0 );
