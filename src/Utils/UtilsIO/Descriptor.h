// The thin layer over the system's files that all writers share: open, close, read, write, seek and tell on one descriptor.
//
// Unbuffered, so that a full disk shows in the very write that meets it. Interrupted calls go on, large transfers are completed piece by
// piece. One thread at a time. No exceptions, no messages.
#pragma once

#include "Core/VideoInterface/Streams.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace UtilsIO
{

enum class EOpenMode : int32_t
{
  Read = 0,                // "rb"
  ReadWrite = 1,           // "r+b": the file must exist
  TruncateReadWrite = 2,   // "w+b"
  Truncate = 3,            // "wb"
  CreateReadWrite = 4,     // made if it is missing, kept as it is otherwise
  CreateNew = 5,           // "wbx": nothing, not even a link, may have the name
};

class VDescriptor
{
public:
  VDescriptor() = default;
  ~VDescriptor();
  VDescriptor( const VDescriptor& ) = delete;
  VDescriptor& operator=( const VDescriptor& ) = delete;

  // UTF-8. False if a file is open already; that one stays open.
  bool Open( const std::string& i_rPath, EOpenMode i_Mode );
  bool IsOpen() const { return m_Handle >= 0; }
  // The system's own, for calls that are not here; -1 if none is open. It stays the descriptor's.
  int Handle() const { return m_Handle; }
  // False if none was open, or if the system reports only now that it could not store what was written. The descriptor is free either way.
  bool Close();

  // All of the bytes or false; the position then stands behind those that were written.
  bool Write( const void* i_pData, size_t i_Size );
  bool Write( const std::vector<KVZ::IOutputStream::VSpan>& i_rSpans );
  // As many as there are, up to i_Size; fewer only at the end of the file.
  bool Read( void* o_pData, size_t i_Size, size_t& o_rRead );

  bool Seek( uint64_t i_Position );
  bool SeekToEnd();
  bool Tell( uint64_t& o_rPosition ) const;

private:
  int m_Handle = -1;
};

}
