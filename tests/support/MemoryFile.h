// A file in memory, whose bytes stay when it is closed.
#pragma once

#include "Utils/UtilsIO/IClosableStream.h"
#include "Utils/UtilsIO/StreamAdapters.h"

#include <memory>
#include <vector>

namespace TestSupport
{

class VMemoryFile : public UtilsIO::IClosableStream
{
public:
  explicit VMemoryFile( std::shared_ptr<std::vector<uint8_t>> i_pBytes ) : m_pBytes( std::move( i_pBytes ) ) {}

  bool Read( void* o_pData, size_t i_Size ) override { return m_Stream.Read( o_pData, i_Size ); }
  bool ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead ) override { return m_Stream.ReadBlock( o_pData, i_Size, o_rRead ); }
  bool IsGood() const override { return m_Stream.IsGood(); }
  bool IsEnd() const override { return m_Stream.IsEnd(); }
  using UtilsIO::IClosableStream::Write;
  bool Write( const void* i_pData, size_t i_Size ) override { return m_Stream.Write( i_pData, i_Size ); }
  bool Tell( uint64_t& o_rPosition ) override { return m_Stream.Tell( o_rPosition ); }
  bool Seek( uint64_t i_Position ) override { return m_Stream.Seek( i_Position ); }
  bool Close() override { return true; }

private:
  const std::shared_ptr<std::vector<uint8_t>> m_pBytes;
  KVZ::ISimpleStreamAdapter m_Stream{ *m_pBytes };
};

}
