// The output of a writer that never forgets a failure, whatever the stream below says after its next seek. It knows its own position, so
// a seek to where it stands already costs nothing. One thread at a time.
#pragma once

#include "Utils/UtilsIO/IClosableStream.h"

#include <functional>
#include <memory>
#include <string>

namespace WriterSupport
{

// Makes an empty stream for a path; an empty pointer if that failed.
using VStreamMaker = std::function<std::unique_ptr<UtilsIO::IClosableStream>( const std::string& i_rPath )>;

// A file on disk, replacing one of that name.
std::unique_ptr<UtilsIO::IClosableStream> MakeFile( const std::string& i_rPath );

class VWatchedStream : public KVZ::IOutputStreamSeekable
{
public:
  explicit VWatchedStream( std::unique_ptr<UtilsIO::IClosableStream> i_pStream ) : m_pStream( std::move( i_pStream ) ) {}

  using KVZ::IOutputStreamSeekable::Write;
  bool Write( const void* i_pData, size_t i_Size ) override;
  bool Write( const std::vector<VSpan>& i_rSpans ) override;
  bool Tell( uint64_t& o_rPosition ) override;
  bool Seek( uint64_t i_Position ) override;

  // Behind the last byte of the file, whatever a failed write has left there included.
  uint64_t GetEnd() const { return m_End; }
  // Any operation so far.
  bool HasFailed() const { return m_bFailed; }

  // True if nothing has failed, now or before.
  bool Close();

private:
  bool Moved( bool i_bDone, uint64_t i_Position );

  const std::unique_ptr<UtilsIO::IClosableStream> m_pStream;
  uint64_t m_Position = 0;
  uint64_t m_End = 0;
  bool m_bPositionKnown = true;
  bool m_bFailed = false;
};

}
