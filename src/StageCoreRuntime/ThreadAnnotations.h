// Lock annotations that clang checks at compile time (-Wthread-safety); other compilers see nothing.
// They work with boost::mutex and boost::lock_guard. boost::unique_lock is not understood and needs NO_LOCK_ANALYSIS on its function.
#pragma once

#if defined( __clang__ )
#define STAGECORE_THREAD_ATTRIBUTE( x ) __attribute__( ( x ) )
#else
#define STAGECORE_THREAD_ATTRIBUTE( x )
#endif

// The member is touched only with this mutex held.
#define GUARDED_BY( x ) STAGECORE_THREAD_ATTRIBUTE( guarded_by( x ) )
// What the pointer points to is touched only with this mutex held.
#define PT_GUARDED_BY( x ) STAGECORE_THREAD_ATTRIBUTE( pt_guarded_by( x ) )
// The caller holds this mutex.
#define REQUIRES( ... ) STAGECORE_THREAD_ATTRIBUTE( requires_capability( __VA_ARGS__ ) )
// The caller does not hold this mutex, because the function takes it.
#define EXCLUDES( ... ) STAGECORE_THREAD_ATTRIBUTE( locks_excluded( __VA_ARGS__ ) )
// The analysis cannot follow this function's locking.
#define NO_LOCK_ANALYSIS STAGECORE_THREAD_ATTRIBUTE( no_thread_safety_analysis )
