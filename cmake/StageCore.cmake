# The kinds of target there are. Each takes the *.cpp files of the folder it is called in.
#
# stagecore_library( NAME [RUNTIME] [DEPENDS target...] )
#   RUNTIME puts the code into libStageCoreRuntime.so, of which module and host share one copy; otherwise a static library.
#   A folder without *.cpp is an interface target.
# stagecore_without_precompiled_header()
#   Its folder's *.cpp are compiled without the common header: they have definitions of their own from a library that the header does not know.
# stagecore_module( NAME VERSION_SCRIPT file [DEPENDS target...] )
#   bin/NAME.tpm, a module that exports what its version script says.
# stagecore_virtual_card( NAME SONAME lib....so VERSION_SCRIPT file [DEPENDS target...] )
#   bin/cards/SONAME, a stand-in for a vendor's run-time library.
# stagecore_program( NAME [DEPENDS target...] )
#   bin/NAME.
# stagecore_test( NAME [LAUNCHER command...] [DEPENDS target...] )
#   A GoogleTest program, registered with CTest under NAME; run by the launcher, where there is one.
# stagecore_system_test( NAME [DEPENDS target...] )
#   A GoogleTest program that runs whole programs: built after them all, run alone, label "system". The environment variable
#   STAGECORE_BIN names the folder of programs, module and cards. The user's own settings are out of reach.
# stagecore_fuzzer( NAME SOURCE file... [DEPENDS target...] )
#   A libFuzzer program with its corpus in the folder corpus/NAME; built where STAGECORE_SANITIZE is address.
#
# The presets asan and tsan compile several *.cpp of a target as one (CMAKE_UNITY_BUILD), which halves their time: what is local to a file needs a
# name that its folder has once, or the target UNITY_BUILD OFF.
#
# The target stagecore_programs is all of bin/, stagecore_unit_tests all tests but the system tests, stagecore_fuzzers all fuzzers.

add_library( StageCoreIncludes INTERFACE )
target_include_directories( StageCoreIncludes INTERFACE "${CMAKE_SOURCE_DIR}/src" "${CMAKE_SOURCE_DIR}" )
target_link_libraries( StageCoreIncludes INTERFACE Boost::headers Threads::Threads )

# What every linked target of ours needs besides its DEPENDS.
set( STAGECORE_COMMON_LIBRARIES StageCoreIncludes Boost::thread Boost::chrono Boost::filesystem )

# Tests have a precompiled header of their own, with GoogleTest in it.
add_library( StageCorePrecompiled STATIC "${CMAKE_CURRENT_LIST_DIR}/Precompiled.cpp" )
target_link_libraries( StageCorePrecompiled PRIVATE ${STAGECORE_COMMON_LIBRARIES} )
target_precompile_headers( StageCorePrecompiled PRIVATE "${CMAKE_CURRENT_LIST_DIR}/Precompiled.h" )

add_library( StageCorePrecompiledTest STATIC "${CMAKE_CURRENT_LIST_DIR}/Precompiled.cpp" )
target_link_libraries( StageCorePrecompiledTest PRIVATE ${STAGECORE_COMMON_LIBRARIES} GTest::gtest )
target_precompile_headers( StageCorePrecompiledTest PRIVATE "${CMAKE_CURRENT_LIST_DIR}/Precompiled.h" <gtest/gtest.h> )

add_custom_target( stagecore_programs )
add_custom_target( stagecore_unit_tests )
add_custom_target( stagecore_fuzzers )

# Gives a target the common precompiled header, or that of the library named as second argument.
function( stagecore_precompile target )
  set( from ${ARGN} StageCorePrecompiled )
  list( GET from 0 from )
  target_precompile_headers( ${target} REUSE_FROM ${from} )
  set_target_properties( ${target} PROPERTIES DEFINE_SYMBOL "" )
endfunction()

function( stagecore_library name )
  cmake_parse_arguments( ARG "RUNTIME" "" "DEPENDS" ${ARGN} )
  file( GLOB sources CONFIGURE_DEPENDS "*.cpp" )
  if( NOT sources )
    add_library( ${name} INTERFACE )
    target_link_libraries( ${name} INTERFACE StageCoreIncludes ${ARG_DEPENDS} )
  elseif( ARG_RUNTIME )
    add_library( ${name}Objects OBJECT ${sources} )
    target_link_libraries( ${name}Objects PUBLIC ${STAGECORE_COMMON_LIBRARIES} )
    stagecore_precompile( ${name}Objects )
    target_sources( StageCoreRuntimeShared PRIVATE $<TARGET_OBJECTS:${name}Objects> )
    add_library( ${name} INTERFACE )
    target_link_libraries( ${name} INTERFACE StageCoreIncludes StageCoreRuntimeShared ${ARG_DEPENDS} )
  else()
    add_library( ${name} STATIC ${sources} )
    target_link_libraries( ${name} PUBLIC ${STAGECORE_COMMON_LIBRARIES} ${ARG_DEPENDS} )
    stagecore_precompile( ${name} )
  endif()
endfunction()

function( stagecore_without_precompiled_header )
  file( GLOB sources CONFIGURE_DEPENDS "*.cpp" )
  set_source_files_properties( ${sources} PROPERTIES SKIP_PRECOMPILE_HEADERS ON )
endfunction()

# Exports what the script names and nothing else, and leaves no name unresolved. Sanitizer run-time libraries are in the program, so there
# a shared object may lack their names.
function( stagecore_export_only target script )
  get_filename_component( script "${script}" ABSOLUTE )
  target_link_options( ${target} PRIVATE "LINKER:--version-script=${script}" )
  if( NOT STAGECORE_SANITIZE )
    target_link_options( ${target} PRIVATE "LINKER:--no-undefined" )
  endif()
  set_property( TARGET ${target} APPEND PROPERTY LINK_DEPENDS "${script}" )
endfunction()

function( stagecore_module name )
  cmake_parse_arguments( ARG "" "VERSION_SCRIPT" "DEPENDS" ${ARGN} )
  file( GLOB sources CONFIGURE_DEPENDS "*.cpp" )
  add_library( ${name} MODULE ${sources} )
  target_link_libraries( ${name} PRIVATE ${STAGECORE_COMMON_LIBRARIES} ${ARG_DEPENDS} )
  stagecore_precompile( ${name} )
  stagecore_export_only( ${name} "${ARG_VERSION_SCRIPT}" )
  set_target_properties( ${name} PROPERTIES PREFIX "" SUFFIX ".tpm" )
  add_dependencies( stagecore_programs ${name} )
endfunction()

function( stagecore_virtual_card name )
  cmake_parse_arguments( ARG "" "SONAME;VERSION_SCRIPT" "DEPENDS" ${ARGN} )
  file( GLOB sources CONFIGURE_DEPENDS "*.cpp" )
  add_library( ${name} SHARED ${sources} )
  target_link_libraries( ${name} PRIVATE ${STAGECORE_COMMON_LIBRARIES} ${ARG_DEPENDS} )
  stagecore_precompile( ${name} )
  stagecore_export_only( ${name} "${ARG_VERSION_SCRIPT}" )
  get_filename_component( output "${ARG_SONAME}" NAME_WLE )
  set_target_properties( ${name} PROPERTIES PREFIX "" OUTPUT_NAME "${output}" LIBRARY_OUTPUT_DIRECTORY "${CMAKE_LIBRARY_OUTPUT_DIRECTORY}/cards" )
  add_dependencies( stagecore_programs ${name} )
endfunction()

function( stagecore_program name )
  cmake_parse_arguments( ARG "" "" "DEPENDS" ${ARGN} )
  file( GLOB sources CONFIGURE_DEPENDS "*.cpp" )
  add_executable( ${name} ${sources} )
  target_link_libraries( ${name} PRIVATE ${STAGECORE_COMMON_LIBRARIES} ${ARG_DEPENDS} )
  stagecore_precompile( ${name} )
  add_dependencies( stagecore_programs ${name} )
endfunction()

function( stagecore_test name )
  cmake_parse_arguments( ARG "" "" "LAUNCHER;DEPENDS" ${ARGN} )
  file( GLOB sources CONFIGURE_DEPENDS "*.cpp" )
  add_executable( ${name} ${sources} )
  target_link_libraries( ${name} PRIVATE ${STAGECORE_COMMON_LIBRARIES} ${ARG_DEPENDS} GTest::gtest GTest::gtest_main )
  stagecore_precompile( ${name} StageCorePrecompiledTest )
  set_target_properties( ${name} PROPERTIES RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/tests" )
  add_test( NAME ${name} COMMAND ${ARG_LAUNCHER} $<TARGET_FILE:${name}> )
  if( NOT STAGECORE_SYSTEM_TEST )
    add_dependencies( stagecore_unit_tests ${name} )
  endif()
endfunction()

function( stagecore_system_test name )
  set( STAGECORE_SYSTEM_TEST ON )
  stagecore_test( ${name} ${ARGN} )
  add_dependencies( ${name} stagecore_programs )
  set_tests_properties( ${name} PROPERTIES LABELS system RUN_SERIAL ON
    ENVIRONMENT "STAGECORE_BIN=${CMAKE_RUNTIME_OUTPUT_DIRECTORY};XDG_CONFIG_HOME=${CMAKE_BINARY_DIR}/tests/no-settings" )
endfunction()

function( stagecore_fuzzer name )
  if( NOT STAGECORE_SANITIZE STREQUAL "address" )
    return()
  endif()
  cmake_parse_arguments( ARG "" "" "SOURCE;DEPENDS" ${ARGN} )
  add_executable( ${name} ${ARG_SOURCE} )
  target_link_libraries( ${name} PRIVATE ${STAGECORE_COMMON_LIBRARIES} ${ARG_DEPENDS} )
  target_link_options( ${name} PRIVATE -fsanitize=fuzzer )
  stagecore_precompile( ${name} )
  set_target_properties( ${name} PROPERTIES RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/fuzzers" )
  add_dependencies( stagecore_fuzzers ${name} )
endfunction()
