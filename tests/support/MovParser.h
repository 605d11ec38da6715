// Reads MOV and MP4 files by the QuickTime file format, and shares no code with the writer of the product.
//
// What a file does not hold as that format says throws std::runtime_error with the place.
#pragma once

#include "tests/support/FileBytes.h"

#include <cstdint>
#include <string>
#include <vector>

namespace TestSupport
{

using VMovBytes = std::vector<uint8_t>;

struct VMovAtom
{
  std::string m_Type;
  uint64_t m_Position = 0;   // of its size field
  uint64_t m_Body = 0;
  uint64_t m_End = 0;
  std::vector<VMovAtom> m_Children;

  // "moov(mvhd trak(tkhd))" without the outermost name.
  std::string Tree() const;
  // The only child of that type, or the one with that number among several; throws where there is none.
  const VMovAtom& Child( const std::string& i_rType, size_t i_Number = 0 ) const;
  bool Has( const std::string& i_rType ) const;
};

struct VMovSample
{
  uint64_t m_Position = 0;
  uint32_t m_Size = 0;         // bytes; of a chunk of sound all of them
  uint32_t m_Count = 1;        // samples of all channels each, in a chunk of sound
  uint64_t m_DecodeTime = 0;   // in the track's timescale
  uint64_t m_ShownTime = 0;    // the same, with the composition offset and without the edit list
  bool m_bKeyFrame = true;
};

struct VMovTrack
{
  std::string m_Handler;   // "vide", "soun", "tmcd"
  uint32_t m_Timescale = 0;
  uint32_t m_MediaDuration = 0;
  uint32_t m_EditDuration = 0;
  uint32_t m_EditStart = 0;
  std::vector<VMovSample> m_Samples;   // of sound chunks
};

class VMovParser
{
public:
  explicit VMovParser( VFileBytes i_Bytes );
  static VMovParser OfFile( const std::string& i_rPath ) { return VMovParser( VFileBytes::OfFile( i_rPath ) ); }
  static VMovParser OfBytes( const VMovBytes& i_rBytes ) { return VMovParser( VFileBytes::OfBytes( i_rBytes ) ); }

  const VMovAtom& Root() const { return m_Root; }
  VMovBytes Body( const VMovAtom& i_rAtom ) const { return m_Bytes.Read( i_rAtom.m_Body, i_rAtom.m_End - i_rAtom.m_Body ); }
  VMovBytes Bytes( const VMovSample& i_rSample ) const { return m_Bytes.Read( i_rSample.m_Position, i_rSample.m_Size ); }
  // Big-endian, from a body.
  uint64_t Number( const VMovAtom& i_rAtom, uint64_t i_Offset, size_t i_Bytes = 4 ) const;

  const std::vector<VMovTrack>& Tracks() const { return m_Tracks; }
  // The only track of that handler; throws where there is none.
  const VMovTrack& Track( const std::string& i_rHandler ) const;

private:
  void ReadAtoms( VMovAtom& io_rParent, uint64_t i_Position ) const;
  VMovTrack ReadTrack( const VMovAtom& i_rTrak ) const;
  void ReadSamples( const VMovAtom& i_rStbl, VMovTrack& o_rTrack ) const;
  std::vector<uint32_t> ReadSizes( const VMovAtom& i_rStsz, uint32_t i_Count ) const;
  std::vector<uint32_t> ReadChunkCounts( const VMovAtom& i_rStsc, size_t i_Chunks ) const;
  std::vector<uint32_t> ReadOffsets( const VMovAtom& i_rStbl, uint32_t i_Count ) const;
  // A table's entries of i_Width bytes, which must fill the atom behind the count at i_Header.
  uint32_t CountEntries( const VMovAtom& i_rAtom, uint64_t i_Header, size_t i_Width ) const;
  uint32_t U32( const VMovAtom& i_rAtom, uint64_t i_Offset ) const { return static_cast<uint32_t>( Number( i_rAtom, i_Offset ) ); }

  VFileBytes m_Bytes;
  VMovAtom m_Root;
  std::vector<VMovTrack> m_Tracks;
};

}
