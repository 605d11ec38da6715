// The numbers and texts that MOV files are made of, big-endian, on the output of one file.
//
// Small writes are collected, so that tables cost few system calls; a list of spans goes to the file in one call, past the buffer and
// without a copy. Write straight on and ask once: when a write or seek has failed, or a value was refused, IsOk stays false and nothing
// more is written. One thread at a time.
#pragma once

#include "FileIO/WriterSupport/WatchedStream.h"

#include <cstdint>
#include <memory>
#include <string_view>
#include <vector>

namespace MovIO
{

class VMovPrimitiveWriter : public KVZ::IOutputStream
{
public:
  // Begins at the stream's start. Without a stream it is not OK.
  explicit VMovPrimitiveWriter( std::shared_ptr<WriterSupport::VWatchedStream> i_pStream );

  bool IsOk() const { return m_bOk; }

  VMovPrimitiveWriter& U8( uint8_t i_Value ) { return Number<1>( i_Value ); }
  VMovPrimitiveWriter& U16( uint16_t i_Value ) { return Number<2>( i_Value ); }
  VMovPrimitiveWriter& U24( uint32_t i_Value ) { return Number<3>( i_Value ); }
  VMovPrimitiveWriter& U32( uint32_t i_Value ) { return Number<4>( i_Value ); }
  VMovPrimitiveWriter& U64( uint64_t i_Value ) { return Number<8>( i_Value ); }
  // Exactly four characters; anything else is refused.
  VMovPrimitiveWriter& FourCC( std::string_view i_Code );
  // At most 254 bytes; anything longer is refused.
  VMovPrimitiveWriter& PascalString( std::string_view i_Text );
  // The same, filled with zeros to i_Width bytes, the length byte among them.
  VMovPrimitiveWriter& PaddedPascalString( std::string_view i_Text, size_t i_Width );
  // Truncated. At least 0 and below 256 and 65536.
  VMovPrimitiveWriter& Fixed8_8( double i_Value ) { return U16( static_cast<uint16_t>( i_Value * 256 ) ); }
  VMovPrimitiveWriter& Fixed16_16( double i_Value ) { return U32( static_cast<uint32_t>( i_Value * 65536 ) ); }
  VMovPrimitiveWriter& Double( double i_Value );
  // The one version of all atoms here, and their flags.
  VMovPrimitiveWriter& Version0( uint32_t i_Flags = 0 ) { return U8( 0 ).U24( i_Flags ); }
  VMovPrimitiveWriter& Zeros( size_t i_Bytes );

  using KVZ::IOutputStream::Write;
  bool Write( const void* i_pData, size_t i_Size ) override;
  bool Write( const std::vector<VSpan>& i_rSpans ) override;

  uint64_t Tell() const { return m_BufferPosition + m_Cursor; }
  bool Seek( uint64_t i_Position );
  // Brings what is collected to the file.
  bool Flush();
  // False if anything has failed before, here or on the stream.
  bool Close();

private:
  static constexpr size_t Capacity = 64 * 1024;   // bytes

  template<size_t TBytes>
  VMovPrimitiveWriter& Number( uint64_t i_Value )
  {
    uint8_t Bytes[TBytes];
    for( size_t Byte = 0; Byte < TBytes; ++Byte )
    {
      Bytes[Byte] = static_cast<uint8_t>( i_Value >> 8 * ( TBytes - 1 - Byte ) );
    }
    return Put( Bytes, TBytes );
  }

  VMovPrimitiveWriter& Put( const void* i_pData, size_t i_Size );   // at most Capacity bytes
  VMovPrimitiveWriter& Refuse();

  const std::shared_ptr<WriterSupport::VWatchedStream> m_pStream;
  bool m_bOk;
  std::vector<uint8_t> m_Buffer;
  uint64_t m_BufferPosition = 0;   // in the file, of the buffer's first byte
  size_t m_Used = 0;
  size_t m_Cursor = 0;   // where the next byte goes, up to m_Used
};

}
