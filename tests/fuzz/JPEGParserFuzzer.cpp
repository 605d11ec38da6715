// Any bytes as a JPEG image: the segments lie in it, in order, and are those that a second reading finds.
#include "FileIO/JPEGIO/JPEGParser.h"
#include "Utils/UtilsIO/StreamAdapters.h"
#include "tests/fuzz/Fuzzing.h"
#include "tests/support/SlowJPEGParser.h"

#include <algorithm>

using Fuzzing::Require;
using JPEGIO::VJPEGSegment;

namespace
{

void RequireInside( const std::vector<VJPEGSegment>& i_rSegments, const std::vector<uint8_t>& i_rImage )
{
  uint64_t End = 0;
  for( const VJPEGSegment& rSegment : i_rSegments )
  {
    Require( rSegment.m_Position >= End, "segments come in order and do not overlap" );
    Require( rSegment.m_Length >= 2 && rSegment.m_Length <= i_rImage.size() - rSegment.m_Position, "segments lie in the image" );
    Require( i_rImage[rSegment.m_Position] == 0xFF && i_rImage[rSegment.m_Position + 1] == rSegment.m_Marker, "a segment begins with its marker" );
    End = rSegment.m_Position + rSegment.m_Length;
  }
}

bool AreEqual( const std::vector<VJPEGSegment>& i_rA, const std::vector<VJPEGSegment>& i_rB )
{
  return std::equal( i_rA.begin(), i_rA.end(), i_rB.begin(), i_rB.end(),
    []( const VJPEGSegment& i_r1, const VJPEGSegment& i_r2 )
    { return i_r1.m_Marker == i_r2.m_Marker && i_r1.m_Position == i_r2.m_Position && i_r1.m_Length == i_r2.m_Length; } );
}

}

extern "C" int LLVMFuzzerTestOneInput( const uint8_t* i_pData, size_t i_Size )
{
  const std::vector<uint8_t> Image( i_pData, i_pData + i_Size );
  std::vector<VJPEGSegment> Segments;
  KVZ::ISimpleInputStreamAdapter Stream( Image );
  const bool bWhole = JPEGIO::ParseJPEGSegments( Stream, Image.size(), Segments );
  RequireInside( Segments, Image );

  const TestSupport::VSlowJPEGResult Expected = TestSupport::ParseSlowly( Image );
  Require( bWhole == Expected.m_Fault.empty(), "both readings find the image whole, or neither" );
  Require( AreEqual( Segments, Expected.m_Segments ), "both readings find the same segments" );

  std::vector<VJPEGSegment> FromMemory;
  Require( JPEGIO::ParseJPEGSegments( i_pData, i_Size, FromMemory ) == bWhole && AreEqual( FromMemory, Segments ), "memory is read like a stream" );
  return 0;
}
