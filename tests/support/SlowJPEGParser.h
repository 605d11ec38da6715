// A second reading of a JPEG image's segments, two bytes at a time from memory, to hold the real parser against. Slow and plain.
#pragma once

#include "FileIO/JPEGIO/JPEGParser.h"

#include <cstdint>
#include <sstream>
#include <string>
#include <vector>

namespace TestSupport
{

struct VSlowJPEGResult
{
  std::vector<JPEGIO::VJPEGSegment> m_Segments;
  std::string m_Fault;   // the line in the log; empty for a whole image
};

inline VSlowJPEGResult ParseSlowly( const std::vector<uint8_t>& i_rImage )
{
  VSlowJPEGResult Result;
  const auto Byte = [&]( uint64_t i_Position ) { return i_Position < i_rImage.size() ? int{ i_rImage[i_Position] } : -1; };
  bool bInScan = false;
  uint64_t Position = 0;
  while( Position < i_rImage.size() )
  {
    const int First = Byte( Position );
    const int Second = Byte( Position + 1 );
    if( First != 0xFF && !bInScan )
    {
      std::ostringstream Text;
      Text << "Unrecognised data found in buffer at 0x" << std::hex << Position;
      Result.m_Fault = Text.str();
      return Result;
    }
    if( First == 0xFF && Second == 0 && !bInScan )
    {
      Result.m_Fault = "0xff00 found outside of image scan.";
      return Result;
    }
    uint64_t Length = First != 0xFF ? 1 : 2;
    const bool bSegment = First == 0xFF && Second != 0;
    if( bSegment && ( Second < 0xD0 || Second > 0xD9 ) )
    {
      Length = 2 + static_cast<uint64_t>( Byte( Position + 2 ) * 256 + Byte( Position + 3 ) );
      bInScan = bInScan || Second == 0xDA;
      if( Byte( Position + 3 ) < 0 )
      {
        Length = i_rImage.size() + 1;
      }
    }
    if( Length > i_rImage.size() - Position )
    {
      Result.m_Fault = "Did not end cleanly.  Data may be truncated or corrupt.";
      return Result;
    }
    if( bSegment )
    {
      Result.m_Segments.push_back( { static_cast<uint8_t>( Second ), Position, Length } );
    }
    Position += Length;
  }
  if( Result.m_Segments.size() < 4 )
  {
    Result.m_Fault = "Not enough segments.  Data may be truncated or corrupt.";
  }
  else if( Result.m_Segments.front().m_Marker != 0xD8 )
  {
    Result.m_Fault = "Missing SOI marker.";
  }
  else if( Result.m_Segments.back().m_Marker != 0xD9 )
  {
    Result.m_Fault = "Missing EOI marker.";
  }
  return Result;
}

}
