#include "FileIO/RapidAVI/JPEGImage.h"

#include "FileIO/JPEGIO/JPEGParser.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <array>

namespace RapidAVI
{

namespace
{

// SOI, APP0, SOF, SOS and EOI, then a quantization table and two Huffman tables for luma, and for chroma where there is any.
constexpr size_t GreySegments = 5 + 3;
constexpr size_t ColourSegments = GreySegments + 3;

constexpr std::array<uint8_t, 20> AVI1Header = {
  0xFF, 0xD8,           // SOI
  0xFF, 0xE0, 0, 16,    // APP0, its length
  'A', 'V', 'I', '1',   // then zeros: not interlaced
};

}

bool MakeAVI1Image( const KVZ::IBufferConst& i_rImage, KVZ::IPixelFormat::Enum i_Format, std::vector<KVZ::IOutputStream::VSpan>& o_rSpans )
{
  o_rSpans.clear();
  std::vector<JPEGIO::VJPEGSegment> Segments;
  if( !JPEGIO::ParseJPEGSegments( i_rImage.Data(), i_rImage.Size(), Segments ) )
  {
    return false;
  }
  const size_t ExpectedSegments = i_Format == KVZ::IPixelFormat::ELuminance8 ? GreySegments : ColourSegments;
  if( Segments.size() != ExpectedSegments || Segments[0].m_Marker != JPEGIO::Marker::StartOfImage ||
    Segments[1].m_Marker != JPEGIO::Marker::Application0 )
  {
    KVZ_LOG_ERROR( "RapidAVI", "Generate JPEG not in expected format." );
    return false;
  }
  const uint64_t Rest = Segments[2].m_Position;
  o_rSpans.emplace_back( AVI1Header.data(), AVI1Header.size() );
  o_rSpans.emplace_back( i_rImage.Data() + Rest, i_rImage.Size() - Rest );
  return true;
}

}
