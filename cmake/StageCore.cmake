# stagecore_library( NAME [RUNTIME] [DEPENDS target...] )
#   The folder's *.cpp as one target. RUNTIME puts its code into libStageCoreRuntime.so, of which module and host share one copy;
#   otherwise it is a static library. A folder without *.cpp is an interface target.
# stagecore_test( NAME [DEPENDS target...] )
#   The folder's *.cpp as one GoogleTest program, registered with CTest under NAME.
# stagecore_precompile( TARGET ) gives a target the common precompiled header.

add_library( StageCorePrecompiled STATIC "${CMAKE_CURRENT_LIST_DIR}/Precompiled.cpp" )
target_precompile_headers( StageCorePrecompiled PRIVATE "${CMAKE_CURRENT_LIST_DIR}/Precompiled.h" )

add_library( StageCoreIncludes INTERFACE )
target_include_directories( StageCoreIncludes INTERFACE "${CMAKE_SOURCE_DIR}/src" "${CMAKE_SOURCE_DIR}" )
target_link_libraries( StageCoreIncludes INTERFACE Boost::headers Threads::Threads )

function( stagecore_precompile target )
  target_precompile_headers( ${target} REUSE_FROM StageCorePrecompiled )
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
    target_link_libraries( ${name}Objects PUBLIC StageCoreIncludes Boost::thread Boost::filesystem )
    stagecore_precompile( ${name}Objects )
    target_sources( StageCoreRuntimeShared PRIVATE $<TARGET_OBJECTS:${name}Objects> )
    add_library( ${name} INTERFACE )
    target_link_libraries( ${name} INTERFACE StageCoreIncludes StageCoreRuntimeShared ${ARG_DEPENDS} )
  else()
    add_library( ${name} STATIC ${sources} )
    target_link_libraries( ${name} PUBLIC StageCoreIncludes Boost::thread Boost::filesystem ${ARG_DEPENDS} )
    stagecore_precompile( ${name} )
  endif()
endfunction()

function( stagecore_test name )
  cmake_parse_arguments( ARG "" "" "DEPENDS" ${ARGN} )
  file( GLOB sources CONFIGURE_DEPENDS "*.cpp" )
  add_executable( ${name} ${sources} )
  target_link_libraries( ${name} PRIVATE StageCoreIncludes ${ARG_DEPENDS} GTest::gtest GTest::gtest_main Boost::thread Boost::filesystem )
  stagecore_precompile( ${name} )
  set_target_properties( ${name} PROPERTIES RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/tests" )
  add_test( NAME ${name} COMMAND ${name} )
endfunction()
