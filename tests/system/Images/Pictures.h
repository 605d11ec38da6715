// Pictures as 8-bit RGB, three bytes a pixel: read by outside programs, and made of a card's 4:2:2 by a conversion of the test's own.
#pragma once

#include "tests/support/ProgramRun.h"

#include <gtest/gtest.h>

#include <boost/filesystem/operations.hpp>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

namespace SystemTests
{

using VPicture = std::vector<uint8_t>;

inline std::string FramePath( const std::string& i_rFolder, uint64_t i_Key, const std::string& i_rExtension )
{
  char Number[16];
  std::snprintf( Number, sizeof( Number ), "%08llu", static_cast<unsigned long long>( i_Key ) );
  return i_rFolder + "/" + boost::filesystem::path( i_rFolder ).filename().string() + "_" + Number + "." + i_rExtension;
}

inline VPicture ToPicture( const TestSupport::VRunResult& i_rRun )
{
  EXPECT_EQ( 0, i_rRun.m_ExitCode ) << i_rRun.m_Error;
  EXPECT_EQ( "", i_rRun.m_Error );
  return { i_rRun.m_Output.begin(), i_rRun.m_Output.end() };
}

inline VPicture DecodeByFFmpeg( const std::string& i_rPath )
{
  return ToPicture( TestSupport::RunProgram( { "ffmpeg", "-nostdin", "-v", "error", "-i", i_rPath, "-f", "rawvideo", "-pix_fmt", "rgb24", "-" } ) );
}

inline VPicture DecodeByImageMagick( const std::string& i_rPath )
{
  return ToPicture( TestSupport::RunProgram( { "convert", i_rPath, "-depth", "8", "rgb:-" } ) );
}

// ITU-R BT.601 in full range, 16 bits behind the point, the remainder dropped.
inline VPicture ConvertPairs( const uint8_t* i_pPairs, size_t i_Size )
{
  const auto Limited = []( int i_Value ) { return static_cast<uint8_t>( std::clamp( i_Value >> 16, 0, 255 ) ); };
  VPicture Picture;
  Picture.reserve( i_Size / 2 * 3 );
  for( size_t Pair = 0; Pair + 4 <= i_Size; Pair += 4 )
  {
    const int U = i_pPairs[Pair];
    const int V = i_pPairs[Pair + 2];
    for( const int Y : { int{ i_pPairs[Pair + 1] }, int{ i_pPairs[Pair + 3] } } )
    {
      Picture.push_back( Limited( 65536 * Y + 91947 * ( V - 128 ) ) );
      Picture.push_back( Limited( 65536 * Y + 8875008 - 46792 * V - 22544 * U ) );
      Picture.push_back( Limited( 65536 * Y + 115998 * ( U - 128 ) ) );
    }
  }
  return Picture;
}

// Decibels; 0 for pictures of different sizes.
inline double SignalToNoise( const VPicture& i_rA, const VPicture& i_rB )
{
  if( i_rA.size() != i_rB.size() || i_rA.empty() )
  {
    return 0.0;
  }
  double Sum = 0.0;
  for( size_t Byte = 0; Byte < i_rA.size(); ++Byte )
  {
    const double Difference = static_cast<double>( i_rA[Byte] ) - i_rB[Byte];
    Sum += Difference * Difference;
  }
  return 10.0 * std::log10( 255.0 * 255.0 / std::max( Sum / static_cast<double>( i_rA.size() ), 1e-9 ) );
}

}
