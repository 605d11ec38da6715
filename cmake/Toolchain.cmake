# Language, warnings, output folders and sanitizers: the same for every target.

set( CMAKE_CXX_STANDARD 20 )
set( CMAKE_CXX_STANDARD_REQUIRED ON )
set( CMAKE_CXX_EXTENSIONS OFF )
set( CMAKE_EXPORT_COMPILE_COMMANDS ON )

# -fPIC everywhere, executables included, so that one precompiled header serves all targets.
add_compile_options( -fPIC -Wall -Wextra -Wpedantic -Werror )
# Source positions in logs and tests begin at the root of the repository.
add_compile_options( "-fmacro-prefix-map=${CMAKE_SOURCE_DIR}/=" )
add_compile_definitions( BOOST_BIND_GLOBAL_PLACEHOLDERS BOOST_ALLOW_DEPRECATED_HEADERS )
if( CMAKE_CXX_COMPILER_ID STREQUAL "Clang" )
  add_compile_options( -Wthread-safety -Xclang -fno-pch-timestamp )
  add_compile_definitions( BOOST_THREAD_ENABLE_THREAD_SAFETY_ANALYSIS )
else()
  # Lets ccache see the precompiled header.
  add_compile_options( -fpch-preprocess )
endif()

# Program, module and libraries lie side by side and find each other there.
set( CMAKE_RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/bin" )
set( CMAKE_LIBRARY_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/bin" )
set( CMAKE_SKIP_BUILD_RPATH OFF )
set( CMAKE_BUILD_RPATH_USE_ORIGIN ON )

set( STAGECORE_SANITIZE "" CACHE STRING "address (with undefined behaviour, and counters for the fuzzers) or thread, with Clang; empty for none" )
if( STAGECORE_SANITIZE STREQUAL "address" )
  # A function out of a library that is opened at run time has no type that could be compared with its pointer's.
  add_compile_options( -fsanitize=fuzzer-no-link,address,undefined -fno-sanitize=function -fno-sanitize-recover=all -fno-omit-frame-pointer )
  add_link_options( -fsanitize=address,undefined )
elseif( STAGECORE_SANITIZE STREQUAL "thread" )
  add_compile_options( -fsanitize=thread -fno-omit-frame-pointer )
  add_link_options( -fsanitize=thread )
elseif( STAGECORE_SANITIZE )
  message( FATAL_ERROR "STAGECORE_SANITIZE is \"${STAGECORE_SANITIZE}\"; it can be address or thread" )
endif()

find_program( STAGECORE_CCACHE ccache )
if( STAGECORE_CCACHE )
  set( CMAKE_CXX_COMPILER_LAUNCHER env CCACHE_SLOPPINESS=pch_defines,time_macros,include_file_mtime,include_file_ctime ${STAGECORE_CCACHE} )
endif()

find_package( Boost 1.74 REQUIRED COMPONENTS chrono thread filesystem )
find_package( Threads REQUIRED )
find_package( GTest REQUIRED )

# Conversion of pixel formats on the graphics card: Qt for its contexts and framebuffers. On where Qt is there.
find_package( Qt5 5.15 QUIET COMPONENTS Core Gui )
option( STAGECORE_OPENGL "Convert pixel formats with OpenGL as well as in software" "${Qt5_FOUND}" )
if( STAGECORE_OPENGL AND NOT Qt5_FOUND )
  message( FATAL_ERROR "STAGECORE_OPENGL needs Qt 5.15, Core and Gui" )
endif()
