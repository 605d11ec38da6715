// Streams on things that are not files: any object with the operations of a stream, and a vector of bytes. All hold what they work on by
// reference. One thread at a time.
#pragma once

#include "Core/VideoInterface/Streams.h"

#include <vector>

namespace KVZ
{

template<class T>
class IOutputStreamAdapter : public IOutputStream
{
public:
  explicit IOutputStreamAdapter( T& io_rTarget ) : m_rTarget( io_rTarget ) {}

  using IOutputStream::Write;
  bool Write( const void* i_pData, size_t i_Size ) override { return m_rTarget.Write( i_pData, i_Size ); }

private:
  T& m_rTarget;
};

template<class T>
class IInputStreamAdapter : public IInputStream
{
public:
  explicit IInputStreamAdapter( T& io_rSource ) : m_rSource( io_rSource ) {}

  bool Read( void* o_pData, size_t i_Size ) override { return m_rSource.Read( o_pData, i_Size ); }
  bool ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead ) override { return m_rSource.ReadBlock( o_pData, i_Size, o_rRead ); }
  bool IsGood() const override { return m_rSource.IsGood(); }
  bool IsEnd() const override { return m_rSource.IsEnd(); }

private:
  T& m_rSource;
};

// Memory as a file for reading and writing: writes past the end make it longer, a gap left by a seek is filled with zeros.
class ISimpleStreamAdapter : public IStreamSeekable
{
public:
  explicit ISimpleStreamAdapter( std::vector<uint8_t>& io_rBytes ) : m_rBytes( io_rBytes ) {}

  bool Read( void* o_pData, size_t i_Size ) override;
  bool ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead ) override;
  bool IsGood() const override { return m_bGood; }
  bool IsEnd() const override { return m_Position >= m_rBytes.size(); }

  using IStreamSeekable::Write;
  bool Write( const void* i_pData, size_t i_Size ) override;

  bool Tell( uint64_t& o_rPosition ) override;
  bool Seek( uint64_t i_Position ) override;

private:
  std::vector<uint8_t>& m_rBytes;
  uint64_t m_Position = 0;
  bool m_bGood = true;
};

// Memory for reading alone. A seek past the end fails.
class ISimpleInputStreamAdapter : public IInputStreamSeekable
{
public:
  explicit ISimpleInputStreamAdapter( const std::vector<uint8_t>& i_rBytes ) : m_rBytes( i_rBytes ) {}

  bool Read( void* o_pData, size_t i_Size ) override;
  bool ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead ) override;
  bool IsGood() const override { return m_bGood; }
  bool IsEnd() const override { return m_Position >= m_rBytes.size(); }

  bool Tell( uint64_t& o_rPosition ) override;
  bool Seek( uint64_t i_Position ) override;

private:
  const std::vector<uint8_t>& m_rBytes;
  uint64_t m_Position = 0;
  bool m_bGood = true;
};

}
