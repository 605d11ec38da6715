#include "Utils/UtilsIO/Descriptor.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <limits>

#include <fcntl.h>
#include <sys/uio.h>
#include <unistd.h>

namespace UtilsIO
{

static_assert( sizeof( off_t ) == 8, "Positions are 64 bits wide." );

namespace
{

int SystemFlags( EOpenMode i_Mode )
{
  switch( i_Mode )
  {
    case EOpenMode::Read: return O_RDONLY;
    case EOpenMode::ReadWrite: return O_RDWR;
    case EOpenMode::TruncateReadWrite: return O_RDWR | O_CREAT | O_TRUNC;
    case EOpenMode::Truncate: return O_WRONLY | O_CREAT | O_TRUNC;
    case EOpenMode::CreateReadWrite: return O_RDWR | O_CREAT;
    case EOpenMode::CreateNew: return O_WRONLY | O_CREAT | O_EXCL;
  }
  return O_RDONLY;
}

template<class TCall>
auto Uninterrupted( TCall i_Call )
{
  decltype( i_Call() ) Result;
  do {
    Result = i_Call();
  } while( Result < 0 && errno == EINTR );
  return Result;
}

// Drops the bytes of the front that the system has taken, and all empty pieces.
void Advance( iovec*& io_pPiece, const iovec* i_pEnd, size_t i_Bytes )
{
  while( io_pPiece != i_pEnd && i_Bytes >= io_pPiece->iov_len )
  {
    i_Bytes -= io_pPiece->iov_len;
    ++io_pPiece;
  }
  if( i_Bytes != 0 )
  {
    io_pPiece->iov_base = static_cast<uint8_t*>( io_pPiece->iov_base ) + i_Bytes;
    io_pPiece->iov_len -= i_Bytes;
  }
}

}

VDescriptor::~VDescriptor() { Close(); }

bool VDescriptor::Open( const std::string& i_rPath, EOpenMode i_Mode )
{
  if( IsOpen() )
  {
    return false;
  }
  m_Handle = Uninterrupted( [&] { return ::open( i_rPath.c_str(), SystemFlags( i_Mode ) | O_CLOEXEC, 0666 ); } );
  return IsOpen();
}

bool VDescriptor::Close()
{
  if( !IsOpen() )
  {
    return false;
  }
  // Not repeated when interrupted: the descriptor is gone by then.
  const int Result = ::close( m_Handle );
  m_Handle = -1;
  return Result == 0 || errno == EINTR;
}

bool VDescriptor::Write( const void* i_pData, size_t i_Size )
{
  const auto* pData = static_cast<const uint8_t*>( i_pData );
  while( i_Size != 0 )
  {
    const ssize_t Written = Uninterrupted( [&] { return ::write( m_Handle, pData, i_Size ); } );
    if( Written <= 0 )
    {
      return false;
    }
    pData += Written;
    i_Size -= static_cast<size_t>( Written );
  }
  return true;
}

bool VDescriptor::Write( const std::vector<KVZ::IOutputStream::VSpan>& i_rSpans )
{
  std::array<iovec, 64> Pieces;
  for( auto Span = i_rSpans.begin(); Span != i_rSpans.end(); )
  {
    const size_t Count = std::min<size_t>( Pieces.size(), static_cast<size_t>( i_rSpans.end() - Span ) );
    const auto Last = Span + static_cast<std::ptrdiff_t>( Count );
    std::transform( Span, Last, Pieces.begin(), []( const auto& i_rSpan ) { return iovec{ const_cast<void*>( i_rSpan.first ), i_rSpan.second }; } );
    Span = Last;

    iovec* pPiece = Pieces.data();
    const iovec* pEnd = pPiece + Count;
    Advance( pPiece, pEnd, 0 );
    while( pPiece != pEnd )
    {
      const ssize_t Written = Uninterrupted( [&] { return ::writev( m_Handle, pPiece, static_cast<int>( pEnd - pPiece ) ); } );
      if( Written <= 0 )
      {
        return false;
      }
      Advance( pPiece, pEnd, static_cast<size_t>( Written ) );
    }
  }
  return true;
}

bool VDescriptor::Read( void* o_pData, size_t i_Size, size_t& o_rRead )
{
  auto* pData = static_cast<uint8_t*>( o_pData );
  o_rRead = 0;
  while( o_rRead != i_Size )
  {
    const ssize_t Count = Uninterrupted( [&] { return ::read( m_Handle, pData + o_rRead, i_Size - o_rRead ); } );
    if( Count <= 0 )
    {
      return Count == 0;
    }
    o_rRead += static_cast<size_t>( Count );
  }
  return true;
}

bool VDescriptor::Seek( uint64_t i_Position )
{
  return i_Position <= static_cast<uint64_t>( std::numeric_limits<off_t>::max() ) &&
    ::lseek( m_Handle, static_cast<off_t>( i_Position ), SEEK_SET ) >= 0;
}

bool VDescriptor::SeekToEnd() { return ::lseek( m_Handle, 0, SEEK_END ) >= 0; }

bool VDescriptor::Tell( uint64_t& o_rPosition ) const
{
  const off_t Position = ::lseek( m_Handle, 0, SEEK_CUR );
  if( Position < 0 )
  {
    return false;
  }
  o_rPosition = static_cast<uint64_t>( Position );
  return true;
}

}
