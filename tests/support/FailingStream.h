// A stream that fails where it is told to, as a disk does: a write that fails leaves what fitted, and the stream refuses transfers until
// it is put to a place again.
#pragma once

#include "Utils/UtilsIO/IClosableStream.h"

#include <algorithm>
#include <limits>
#include <memory>
#include <new>

namespace TestSupport
{

struct VFault
{
  static constexpr uint64_t Never = std::numeric_limits<uint64_t>::max();

  uint64_t m_Offset = Never;      // nothing can be stored at this offset and behind it: the disk is full
  uint64_t m_Operation = Never;   // this operation (write, seek, tell or close, counted from 0) fails, later ones work again; streams that
                                  // are given the same count of operations count together
  bool m_bThrows = false;         // that operation throws instead
};

class VFailingStream : public UtilsIO::IClosableStream
{
public:
  VFailingStream( std::unique_ptr<UtilsIO::IClosableStream> i_pStream, const VFault& i_rFault, uint64_t* io_pOperations = nullptr )
    : m_pStream( std::move( i_pStream ) ), m_Fault( i_rFault ), m_pOperations( io_pOperations ? io_pOperations : &m_Operations )
  {
  }

  bool Read( void* o_pData, size_t i_Size ) override { return m_bGood && m_pStream->Read( o_pData, i_Size ); }
  bool ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead ) override { return m_bGood && m_pStream->ReadBlock( o_pData, i_Size, o_rRead ); }
  bool IsGood() const override { return m_bGood && m_pStream->IsGood(); }

  using UtilsIO::IClosableStream::Write;
  bool Write( const void* i_pData, size_t i_Size ) override
  {
    const bool bFault = IsFault();
    uint64_t Position = 0;
    m_pStream->Tell( Position );
    const size_t Room = bFault ? i_Size / 2 : std::min<uint64_t>( i_Size, m_Fault.m_Offset - std::min( Position, m_Fault.m_Offset ) );
    m_bGood = m_bGood && m_pStream->Write( i_pData, Room ) && Room == i_Size && !bFault;
    return m_bGood;
  }

  bool Tell( uint64_t& o_rPosition ) override { return !IsFault() && m_pStream->Tell( o_rPosition ); }

  bool Seek( uint64_t i_Position ) override
  {
    m_bGood = !IsFault() && m_pStream->Seek( i_Position );
    return m_bGood;
  }

  bool Close() override { return !IsFault() && m_pStream->Close(); }

private:
  bool IsFault()
  {
    const bool bFault = ( *m_pOperations )++ == m_Fault.m_Operation;
    if( bFault && m_Fault.m_bThrows )
    {
      throw std::bad_alloc();
    }
    return bFault;
  }

  const std::unique_ptr<UtilsIO::IClosableStream> m_pStream;
  const VFault m_Fault;
  uint64_t m_Operations = 0;
  uint64_t* const m_pOperations;
  bool m_bGood = true;
};

}
