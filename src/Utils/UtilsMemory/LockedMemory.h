// Process-wide helpers for memory that must stay resident. The system may refuse either wish; that is logged and is no failure.
// Any thread.
#pragma once

#include <cstddef>

namespace UtilsMemory
{

// Bytes that the process wants to keep resident at least and at most. Here it is the limit of lockable memory (RLIMIT_MEMLOCK), which is
// raised to the maximum. False, with a log entry, where the process may not; it is then raised as far as every process may.
bool SetWorkingSet( size_t i_Minimum, size_t i_Maximum );

// Page-aligned memory, locked where the system allows it. Null only if there is no memory at all.
void* AllocateLocked( size_t i_Size );
// The size as it was asked for. Null is ignored.
void FreeLocked( void* i_pMemory, size_t i_Size );

}
