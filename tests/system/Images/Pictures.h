// Pictures as 8-bit RGB, three bytes a pixel, and what tells whether they are those of a card.
#pragma once

#include "tests/support/OutsideReaders.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/StageHost.h"

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

// One frame of a recording: in RGB as FFmpeg reads it of an image file, or, without an extension, as it lies in a tvid.
inline VPicture FrameOf( const VHostResult& i_rResult, uint64_t i_Key, const std::string& i_rExtension = {} )
{
  if( !i_rExtension.empty() )
  {
    return TestSupport::DecodeVideo( FramePath( i_rResult.Path(), i_Key, i_rExtension ), "rgb24" );
  }
  const TestSupport::VTvidParser File( i_rResult.Path() );
  return i_Key < File.Frames().size() ? File.Video( File.Frames()[i_Key] ) : VPicture();
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
