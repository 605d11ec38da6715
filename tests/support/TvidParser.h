// Reads tvid files as docs/tvid.md describes them, and shares no code with the writer or the reader of the product.
//
// What a file does not hold as described throws std::runtime_error with the place.
#pragma once

#include "tests/support/FileBytes.h"

#include <cstdint>
#include <map>
#include <string>
#include <variant>
#include <vector>

namespace TestSupport
{

class VTvidParser
{
public:
  // Integers widen to 64 bits, float to double.
  using VValue = std::variant<bool, int64_t, uint64_t, double, std::string>;
  using VAttributes = std::map<std::string, VValue>;

  struct VFrame
  {
    uint64_t m_Key = 0;   // in a file that was never closed the record's number
    uint64_t m_VideoPosition = 0;
    uint64_t m_VideoSize = 0;
    uint64_t m_AudioPosition = 0;
    uint64_t m_AudioSize = 0;
  };

  explicit VTvidParser( const std::string& i_rPath );

  bool IsFinished() const { return m_bFinished; }
  const VAttributes& Internal() const { return m_Internal; }
  const VAttributes& External() const { return m_External; }
  // Of whichever block holds the key; throws where none does, or the value is of another kind.
  int64_t Number( const std::string& i_rKey ) const;
  std::string Text( const std::string& i_rKey ) const;

  uint32_t Width() const { return m_Width; }
  uint32_t Channels() const { return m_Channels; }
  const std::vector<VFrame>& Frames() const { return m_Frames; }
  uint64_t FileSize() const { return m_File.Size(); }
  uint64_t RecordsStart() const { return m_RecordsStart; }

  std::vector<uint8_t> Video( const VFrame& i_rFrame ) const { return m_File.Read( i_rFrame.m_VideoPosition, i_rFrame.m_VideoSize ); }
  // Interleaved samples of a file with Int16.
  std::vector<uint16_t> Audio( const VFrame& i_rFrame ) const;

private:
  // What lies at the cursor, which goes on behind it.
  uint64_t Next( uint64_t i_Bytes );
  std::string NextText();
  VValue ReadValue( uint64_t i_Tag );
  VAttributes ReadBlock();
  void ReadHeader();
  void ReadDescription();
  void ReadIndex();
  void WalkRecords();
  bool ReadRecord( uint64_t i_Key, uint64_t i_Position, uint64_t i_Limit );
  const VValue& Find( const std::string& i_rKey ) const;

  const VFileBytes m_File;
  uint64_t m_Cursor = 0;
  bool m_bFinished = false;
  VAttributes m_Internal;
  VAttributes m_External;
  uint32_t m_Width = 0;
  uint32_t m_Channels = 0;   // 0: no audio
  uint64_t m_ImageSize = 0;
  uint64_t m_IndexPosition = 0;
  uint64_t m_RecordsStart = 0;
  std::vector<VFrame> m_Frames;
};

}
