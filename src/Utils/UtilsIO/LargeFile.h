// A file as a stream, of any size and unbuffered. One thread at a time.
//
// The good flag is sticky: after a failed or short transfer every Read and Write is refused until a Seek sets the flag anew. Whoever must
// not forget a failed write has to remember it himself.
#pragma once

#include "Utils/UtilsIO/Descriptor.h"
#include "Utils/UtilsIO/IClosableStream.h"

namespace UtilsIO
{

class VLargeFile : public IClosableStream
{
public:
  // UTF-8. False if a file is open already; that one stays open.
  bool Open( const std::string& i_rPath, EOpenMode i_Mode );
  bool IsOpen() const { return m_Descriptor.IsOpen(); }
  bool Close() override;

  // Bytes, as found by Open.
  uint64_t GetSize() const { return m_Size; }

  bool Read( void* o_pData, size_t i_Size ) override;
  bool ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead ) override;
  bool IsGood() const override { return m_bGood; }
  // A read has met the end of the file since the last seek.
  bool IsEnd() const override { return m_bEnd; }

  using IClosableStream::Write;
  bool Write( const void* i_pData, size_t i_Size ) override;
  // In one system call where the system takes it at once.
  bool Write( const std::vector<VSpan>& i_rSpans ) override;

  bool Tell( uint64_t& o_rPosition ) override;
  bool Seek( uint64_t i_Position ) override;
  bool SeekToEnd();

private:
  VDescriptor m_Descriptor;
  uint64_t m_Size = 0;
  bool m_bGood = true;
  bool m_bEnd = false;
};

}
