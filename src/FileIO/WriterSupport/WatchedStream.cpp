#include "FileIO/WriterSupport/WatchedStream.h"

#include "StageCoreRuntime/GlobalLog.h"
#include "Utils/UtilsIO/LargeFile.h"

#include <algorithm>
#include <cerrno>
#include <system_error>

namespace WriterSupport
{

namespace
{

// The system's reason, where the stream is one of its files: to the person who reads it a full disk is something else than a revoked right.
void LogSystemReason( const char* i_pWhat )
{
  if( errno != 0 )
  {
    KVZ_LOG_ERROR( "WriterSupport", "%1%: %2%.", i_pWhat, std::generic_category().message( errno ) );
  }
}

}

std::unique_ptr<UtilsIO::IClosableStream> MakeFile( const std::string& i_rPath )
{
  auto pFile = std::make_unique<UtilsIO::VLargeFile>();
  errno = 0;
  if( !pFile->Open( i_rPath, UtilsIO::EOpenMode::Truncate ) )
  {
    LogSystemReason( "Opening failed" );
    return nullptr;
  }
  return pFile;
}

bool VWatchedStream::Write( const void* i_pData, size_t i_Size )
{
  errno = 0;
  return Moved( m_pStream->Write( i_pData, i_Size ), m_Position + i_Size );
}

bool VWatchedStream::Write( const std::vector<VSpan>& i_rSpans )
{
  uint64_t Size = 0;
  for( const VSpan& rSpan : i_rSpans )
  {
    Size += rSpan.second;
  }
  errno = 0;
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
  if( !i_bDone && !m_bFailed )
  {
    LogSystemReason( "Writing failed" );
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
