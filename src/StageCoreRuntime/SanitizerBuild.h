// Whether this build runs under a sanitizer, which brings its own signal handlers and signal stacks.
#pragma once

#if defined( __SANITIZE_ADDRESS__ ) || defined( __SANITIZE_THREAD__ )
#define STAGECORE_SANITIZER_BUILD 1
#elif defined( __has_feature )
#if __has_feature( address_sanitizer ) || __has_feature( thread_sanitizer )
#define STAGECORE_SANITIZER_BUILD 1
#endif
#endif

namespace DebugServices
{
#if defined( STAGECORE_SANITIZER_BUILD )
constexpr bool IsSanitizerBuild = true;
#else
constexpr bool IsSanitizerBuild = false;
#endif
}
