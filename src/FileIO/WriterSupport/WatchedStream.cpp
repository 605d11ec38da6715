#include "FileIO/WriterSupport/WatchedStream.h"

#include "Utils/UtilsIO/LargeFile.h"

#include <algorithm>

namespace WriterSupport
{

std::unique_ptr<UtilsIO::IClosableStream> MakeFile( const std::string& i_rPath )
{
  auto pFile = std::make_unique<UtilsIO::VLargeFile>();
  return pFile->Open( i_rPath, UtilsIO::EOpenMode::Truncate ) ? std::move( pFile ) : nullptr;
}

bool VWatchedStream::Write( const void* i_pData, size_t i_Size ) { return Moved( m_pStream->Write( i_pData, i_Size ), m_Position + i_Size ); }

bool VWatchedStream::Write( const std::vector<VSpan>& i_rSpans )
{
  uint64_t Size = 0;
  for( const VSpan& rSpan : i_rSpans )
  {
    Size += rSpan.second;
  }
  return Moved( m_pStream->Write( i_rSpans ), m_Position + Size );
}

bool VWatchedStream::Tell( uint64_t& o_rPosition )
{
  if( !m_bPositionKnown )
  {
    m_bPositionKnown = m_pStream->Tell( m_Position );
    m_End = m_bPositionKnown ? std::max( m_End, m_Position ) : m_End;
    m_bFailed = m_bFailed || !m_bPositionKnown;
  }
  o_rPosition = m_bPositionKnown ? m_Position : o_rPosition;
  return m_bPositionKnown;
}

bool VWatchedStream::Seek( uint64_t i_Position )
{
  if( m_bPositionKnown && m_Position == i_Position )
  {
    return true;
  }
  m_bPositionKnown = m_pStream->Seek( i_Position );
  m_Position = m_bPositionKnown ? i_Position : m_Position;
  m_bFailed = m_bFailed || !m_bPositionKnown;
  return m_bPositionKnown;
}

bool VWatchedStream::Close()
{
  m_bFailed = !m_pStream->Close() || m_bFailed;
  return !m_bFailed;
}

// After a write. One that failed may have moved the position all the same.
bool VWatchedStream::Moved( bool i_bDone, uint64_t i_Position )
{
  if( i_bDone && m_bPositionKnown )
  {
    m_Position = i_Position;
    m_End = std::max( m_End, m_Position );
    return true;
  }
  m_bFailed = m_bFailed || !i_bDone;
  m_bPositionKnown = false;
  uint64_t Position = 0;
  Tell( Position );
  // The stream below refuses everything until it has been put to a place again.
  m_bPositionKnown = false;
  return i_bDone;
}

}
