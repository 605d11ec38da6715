#include "SyncSystem/RefCountedToken.h"

#include "SyncSystem/CaptureBuffer.h"

#include <utility>

namespace SyncSystem
{

VRefCountedToken::VRefCountedToken( std::shared_ptr<VCaptureBuffer> i_pBuffer, const VToken& i_rPinned )
  : m_Token( i_rPinned ), m_pBuffer( std::move( i_pBuffer ) )
{
}

VRefCountedToken::VRefCountedToken( const VRefCountedToken& i_rOther ) : m_Token( i_rOther.m_Token ), m_pBuffer( i_rOther.m_pBuffer )
{
  if( m_Token.m_pFrame ) m_pBuffer->Allocator().Pin( m_Token.m_pFrame, true );
}

VRefCountedToken::VRefCountedToken( VRefCountedToken&& io_rOther ) noexcept
  : m_Token( std::exchange( io_rOther.m_Token, VToken() ) ), m_pBuffer( std::move( io_rOther.m_pBuffer ) )
{
}

VRefCountedToken& VRefCountedToken::operator=( VRefCountedToken i_Other ) noexcept
{
  std::swap( m_Token, i_Other.m_Token );
  std::swap( m_pBuffer, i_Other.m_pBuffer );
  return *this;
}

VRefCountedToken::~VRefCountedToken() { Clear(); }

void VRefCountedToken::Clear()
{
  if( m_Token.m_pFrame ) m_pBuffer->Allocator().Pin( m_Token.m_pFrame, false );
  m_Token = VToken();
  m_pBuffer.reset();
}

}
