#include "FileIO/MovIO/AtomScope.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <limits>

namespace MovIO
{

VAtomScope::VAtomScope( VMovPrimitiveWriter& io_rOut, const char* i_pType ) : m_rOut( io_rOut ), m_pType( i_pType ), m_Start( io_rOut.Tell() )
{
  m_rOut.U32( 0 ).FourCC( i_pType );
}

bool VAtomScope::Close( bool i_bContent )
{
  const uint64_t End = m_rOut.Tell();
  const bool bPatched = PatchSize( End - m_Start ) && m_rOut.Seek( End );
  if( !i_bContent || !bPatched )
  {
    KVZ_LOG_ERROR( "MovIO", "Could not write the '%s' atom.", m_pType );
    return false;
  }
  return true;
}

bool VAtomScope::CloseSized( uint32_t i_Size, bool i_bContent )
{
  const uint64_t Size = m_rOut.Tell() - m_Start;
  if( i_bContent && m_rOut.IsOk() && Size != i_Size )
  {
    KVZ_LOG_ERROR( "MovIO", "The '%s' atom was written but the size was %d, not %d as expected.", m_pType, Size, i_Size );
  }
  return Close( i_bContent );
}

bool VAtomScope::PatchSize( uint64_t i_Size )
{
  constexpr uint64_t Limit = std::numeric_limits<uint32_t>::max();
  if( i_Size > Limit )
  {
    KVZ_LOG_ERROR( "MovIO", "The '%s' atom has %d bytes, more than the %d that its size can say.", m_pType, i_Size, Limit );
    return false;
  }
  return m_rOut.Seek( m_Start ) && m_rOut.U32( static_cast<uint32_t>( i_Size ) ).IsOk();
}

}
