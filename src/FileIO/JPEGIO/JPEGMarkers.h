// What is known of each JPEG marker: how its length is told, and a text for dumps of segments.
#pragma once

#include <array>
#include <cstdint>

namespace JPEGIO
{

namespace MarkerLength
{
constexpr int8_t NoSegment = -1;
constexpr int8_t Follows = 0;   // two bytes, big-endian, behind the marker; they count themselves
constexpr int8_t Alone = 2;
}

// By the byte behind FF: one of the above. A positive entry is the segment's whole length in bytes.
constexpr std::array<int8_t, 256> MarkerLengths = []
{
  std::array<int8_t, 256> Lengths{};
  Lengths[0x00] = MarkerLength::NoSegment;
  for( int Marker = 0xD0; Marker <= 0xD9; ++Marker )
  {
    Lengths[Marker] = MarkerLength::Alone;
  }
  return Lengths;
}();

struct VMarkerText
{
  uint8_t m_First;
  uint8_t m_Last;
  const char* m_pText;
};

constexpr std::array MarkerTexts = {
  VMarkerText{ 0xC0, 0xC0, "Start of frame\n  Type: Nondifferential/Huffman/Baseline DCT" },
  VMarkerText{ 0xC1, 0xC1, "Start of frame\n  Type: Nondifferential/Huffman/Sequential DCT" },
  VMarkerText{ 0xC2, 0xC2, "Start of frame\n  Type: Nondifferential/Huffman/Progressive DCT" },
  VMarkerText{ 0xC3, 0xC3, "Start of frame\n  Type: Nondifferential/Huffman/Lossless" }, VMarkerText{ 0xC4, 0xC4, "Define Huffman table" },
  VMarkerText{ 0xC5, 0xC5, "Start of frame\n  Type: Differential/Huffman/Sequential DCT" },
  VMarkerText{ 0xC6, 0xC6, "Start of frame\n  Type: Differential/Huffman/Progressive DCT" },
  VMarkerText{ 0xC7, 0xC7, "Start of frame\n  Type: Differential/Huffman/Lossless" }, VMarkerText{ 0xC8, 0xC8, "Reserved for extensions" },
  VMarkerText{ 0xC9, 0xC9, "Start of frame\n  Type: Nondifferential/Arithmetic/Sequential DCT" },
  VMarkerText{ 0xCA, 0xCA, "Start of frame\n  Type: Nondifferential/Arithmetic/Progressive DCT" },
  VMarkerText{ 0xCB, 0xCB, "Start of frame\n  Type: Nondifferential/Arithmetic/Lossless" }, VMarkerText{ 0xCC, 0xCC, "Define arithmetic table" },
  VMarkerText{ 0xCD, 0xCD, "Start of frame\n  Type: Differential/Arithmetic/Sequential DCT" },
  VMarkerText{ 0xCE, 0xCE, "Start of frame\n  Type: Differential/Arithmetic/Progressive DCT" },
  VMarkerText{ 0xCF, 0xCF, "Start of frame\n  Type: Differential/Arithmetic/Lossless" }, VMarkerText{ 0xD0, 0xD7, "Resync marker" },
  VMarkerText{ 0xD8, 0xD8, "Start of image" }, VMarkerText{ 0xD9, 0xD9, "End of image" }, VMarkerText{ 0xDA, 0xDA, "Start of scan" },
  VMarkerText{ 0xDB, 0xDB, "Define quantization table" }, VMarkerText{ 0xDC, 0xDC, "Define number of lines" },
  VMarkerText{ 0xDD, 0xDD, "Define restart interval" }, VMarkerText{ 0xDE, 0xDE, "Define hierarchical progression" },
  VMarkerText{ 0xDF, 0xDF, "Expand reference components" },
  VMarkerText{ 0xE0, 0xE0, "Application specific\n  FourCC: '%c%c%c%c'" },   // the four bytes behind the length
  VMarkerText{ 0xE1, 0xE1, "Application specific (eg EXIF)" }, VMarkerText{ 0xE2, 0xE2, "Application specific (eg XMP, ICC, Flashpix)" },
  VMarkerText{ 0xE3, 0xE3, "APP3" }, VMarkerText{ 0xE4, 0xE4, "APP4" }, VMarkerText{ 0xE5, 0xE5, "APP5" }, VMarkerText{ 0xE6, 0xE6, "APP6" },
  VMarkerText{ 0xE7, 0xE7, "APP7" }, VMarkerText{ 0xE8, 0xE8, "APP8" }, VMarkerText{ 0xE9, 0xE9, "APP9" }, VMarkerText{ 0xEA, 0xEA, "APP10" },
  VMarkerText{ 0xEB, 0xEB, "APP11" }, VMarkerText{ 0xEC, 0xEC, "APP12" },
  VMarkerText{ 0xED, 0xED, "Application specific (eg Adobe Photoshop, IPTC)" }, VMarkerText{ 0xEE, 0xEE, "APP14" },
  VMarkerText{ 0xEF, 0xEF, "APP15" }, VMarkerText{ 0xFE, 0xFE, "Comment\n  Text: \"" },   // the text follows
};
static_assert( MarkerTexts.size() == 42 );

// Null for a marker without a text.
constexpr const char* FindMarkerText( uint8_t i_Marker )
{
  for( const VMarkerText& rRow : MarkerTexts )
  {
    if( rRow.m_First <= i_Marker && i_Marker <= rRow.m_Last )
    {
      return rRow.m_pText;
    }
  }
  return nullptr;
}

}
