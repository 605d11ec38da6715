// Reads EBML and the parts of Matroska that our files have. Knows nothing of the code that writes them: ids are those of RFC 8794 and RFC 9559.
#pragma once

#include "tests/support/FileBytes.h"

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace TestSupport
{

namespace Ebml
{
enum EId : uint32_t
{
  Head = 0x1A45DFA3,
  DocType = 0x4282,
  DocTypeVersion = 0x4287,
  DocTypeReadVersion = 0x4285,
  Void = 0xEC,
  Segment = 0x18538067,
  SeekHead = 0x114D9B74,
  Seek = 0x4DBB,
  SeekID = 0x53AB,
  SeekPosition = 0x53AC,
  Info = 0x1549A966,
  SegmentUID = 0x73A4,
  TimestampScale = 0x2AD7B1,
  Duration = 0x4489,
  DateUTC = 0x4461,
  MuxingApp = 0x4D80,
  WritingApp = 0x5741,
  Tracks = 0x1654AE6B,
  TrackEntry = 0xAE,
  CodecID = 0x86,
  CodecPrivate = 0x63A2,
  Video = 0xE0,
  UncompressedFourCC = 0x2EB524,
  Audio = 0xE1,
  Channels = 0x9F,
  BitDepth = 0x6264,
  Tags = 0x1254C367,
  Tag = 0x7373,
  Targets = 0x63C0,
  TagAttachmentUID = 0x63C6,
  SimpleTag = 0x67C8,
  TagName = 0x45A3,
  TagString = 0x4487,
  Cluster = 0x1F43B675,
  Timestamp = 0xE7,
  BlockGroup = 0xA0,
  Block = 0xA1,
  BlockDuration = 0x9B,
  Cues = 0x1C53BB6B,
  CuePoint = 0xBB,
  CueTime = 0xB3,
  CueTrackPositions = 0xB7,
  CueTrack = 0xF7,
  CueClusterPosition = 0xF1
};
}

struct VEbmlElement
{
  using VPath = std::vector<uint32_t>;

  uint32_t m_Id = 0;
  uint64_t m_Position = 0;   // of its first byte
  uint64_t m_Data = 0;       // where its data begin
  uint64_t m_Size = 0;       // bytes of data; of an unknown size as far as whole elements follow
  int m_SizeBytes = 0;       // of the coded size
  bool m_bUnknownSize = false;
  std::vector<VEbmlElement> m_Children{};   // of a master

  uint64_t End() const { return m_Data + m_Size; }

  // All elements below that the ids lead to, from the outermost one, or the first of them; throws where there is none.
  std::vector<const VEbmlElement*> FindAll( const VPath& i_rPath ) const;
  const VEbmlElement& Find( const VPath& i_rPath ) const;
};

class VEbmlParser
{
public:
  using VBytes = std::vector<uint8_t>;
  using VPath = VEbmlElement::VPath;

  // Throws std::runtime_error where an element runs past its parent's end; in a segment of unknown size such a one ends the reading.
  explicit VEbmlParser( const VBytes& i_rBytes );

  std::vector<const VEbmlElement*> FindAll( const VPath& i_rPath ) const { return m_File.FindAll( i_rPath ); }
  const VEbmlElement& Find( const VPath& i_rPath ) const { return m_File.Find( i_rPath ); }
  uint64_t Number( const VPath& i_rPath ) const { return NumberOf( Find( i_rPath ) ); }
  std::string Text( const VPath& i_rPath ) const { return TextOf( Find( i_rPath ) ); }
  double Real( const VPath& i_rPath ) const;

  uint64_t NumberOf( const VEbmlElement& i_rElement ) const { return m_Bytes.Big( i_rElement.m_Data, i_rElement.m_Size ); }
  std::string TextOf( const VEbmlElement& i_rElement ) const { return m_Bytes.Text( i_rElement.m_Data, i_rElement.m_Size ); }
  VBytes BytesOf( const VEbmlElement& i_rElement ) const { return m_Bytes.Read( i_rElement.m_Data, i_rElement.m_Size ); }

private:
  std::vector<VEbmlElement> Parse( uint64_t i_Begin, uint64_t i_End, bool i_bMayBeCut ) const;
  bool ParseHead( uint64_t i_End, VEbmlElement& io_rElement ) const;
  // Of the number that begins there: as many as its first byte has leading zeros, and one.
  uint64_t CodedBytes( uint64_t i_Position ) const;

  const VFileBytes m_Bytes;
  VEbmlElement m_File;   // what stands for it all
};

struct VMatroskaBlock
{
  uint64_t m_Cluster = 0;   // position of its cluster in the file
  uint64_t m_Track = 0;
  uint64_t m_Time = 0;
  uint64_t m_Duration = 0;
  std::vector<uint8_t> m_Data{};
};

struct VMatroskaCue
{
  uint64_t m_Time = 0;
  uint64_t m_Track = 0;
  uint64_t m_Cluster = 0;   // position in the file
};

struct VMatroskaSeek
{
  uint32_t m_Id = 0;
  uint64_t m_Position = 0;   // in the file
};

// In file order.
std::vector<VMatroskaBlock> ReadBlocks( const VEbmlParser& i_rFile );
std::vector<VMatroskaCue> ReadCues( const VEbmlParser& i_rFile );
// Of all SeekHeads.
std::vector<VMatroskaSeek> ReadSeeks( const VEbmlParser& i_rFile );
// Text by name.
std::map<std::string, std::string> ReadTags( const VEbmlParser& i_rFile );

}
