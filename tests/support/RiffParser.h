// An independent reader of RIFF files and of what AVI makes of them. It trusts nothing: whatever does not hold together throws
// std::runtime_error with the position.
#pragma once

#include "tests/support/FileBytes.h"

#include <cstdint>
#include <string>
#include <vector>

namespace TestSupport
{

struct VRiffChunk
{
  std::string m_Id;
  std::string m_Form;   // of RIFF and LIST
  uint64_t m_Position = 0;
  uint64_t m_Data = 0;   // position of the content, behind the form
  uint64_t m_Size = 0;   // of the content, the form not counted
  std::vector<VRiffChunk> m_Children;

  // The only child of that id, or form in the case of a list; throws where there is none or more than one.
  const VRiffChunk& Child( const std::string& i_rIdOrForm ) const;
  size_t Count( const std::string& i_rIdOrForm ) const;
};

class VRiffParser
{
public:
  using VBytes = std::vector<uint8_t>;

  // Reads all of a file, chunk by chunk to its last byte.
  explicit VRiffParser( const VBytes& i_rBytes );
  static VBytes ReadFile( const std::string& i_rPath );

  const std::vector<VRiffChunk>& Riffs() const { return m_Riffs; }
  VBytes Content( const VRiffChunk& i_rChunk ) const { return Bytes( i_rChunk.m_Data, i_rChunk.m_Size ); }
  VBytes Bytes( uint64_t i_Position, uint64_t i_Size ) const { return m_Bytes.Read( i_Position, i_Size ); }
  uint16_t U16( uint64_t i_Position ) const { return static_cast<uint16_t>( m_Bytes.Little( i_Position, 2 ) ); }
  uint32_t U32( uint64_t i_Position ) const { return static_cast<uint32_t>( m_Bytes.Little( i_Position, 4 ) ); }
  uint64_t U64( uint64_t i_Position ) const { return m_Bytes.Little( i_Position, 8 ); }
  std::string FourCC( uint64_t i_Position ) const { return m_Bytes.Text( i_Position, 4 ); }

private:
  std::vector<VRiffChunk> ParseChunks( uint64_t i_Position, uint64_t i_End ) const;

  const VFileBytes m_Bytes;
  std::vector<VRiffChunk> m_Riffs;
};

// An AVI with OpenDML indexes. What the three indexes say is compared with what a walk through the chunks finds.
class VAviParser
{
public:
  explicit VAviParser( std::vector<uint8_t> i_Bytes );

  const VRiffParser& Riff() const { return m_Riff; }
  const VRiffChunk& Headers() const { return m_Riff.Riffs().front().Child( "hdrl" ); }
  // "strl" by number
  const VRiffChunk& Stream( size_t i_Number ) const;
  uint32_t TotalFrames() const;
  uint32_t StreamLength( size_t i_Number ) const;
  uint32_t SuperIndexEntries( size_t i_Number ) const;

  // Of a stream, in the order of the file; found by walking.
  const std::vector<VRiffChunk>& Chunks( size_t i_Stream ) const { return m_Chunks.at( i_Stream ); }
  // Chunks that the super index reaches; the others are those of the last RIFFs.
  size_t CountIndexed( size_t i_Stream ) const { return m_Indexed.at( i_Stream ); }

private:
  void Walk();
  void CheckSuperIndex( size_t i_Stream );
  void CheckStandardIndex( size_t i_Stream, uint64_t i_Position, uint32_t i_Size, uint32_t i_Duration );
  void CheckOldIndex() const;

  const VRiffParser m_Riff;
  std::vector<std::vector<VRiffChunk>> m_Chunks;
  std::vector<VRiffChunk> m_InFirstRiff;   // of all streams
  std::vector<size_t> m_Indexed;
};

}
