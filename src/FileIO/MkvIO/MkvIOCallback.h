// The file as libebml and libmatroska see it. What fails here throws std::runtime_error, and the stream below keeps it in mind.
#pragma once

#include "FileIO/WriterSupport/WatchedStream.h"

#include <ebml/IOCallback.h>

#include <memory>

namespace MkvIO
{

class VMkvIOCallback : public libebml::IOCallback
{
public:
  explicit VMkvIOCallback( std::unique_ptr<UtilsIO::IClosableStream> i_pStream ) : m_Stream( std::move( i_pStream ) ) {}

  // For what goes to the file without the libraries, and without exceptions.
  WriterSupport::VWatchedStream& Stream() { return m_Stream; }

  // Always throws: the file is open for writing alone.
  uint32_t read( void* o_pData, size_t i_Size ) override;
  void setFilePointer( int64_t i_Offset, libebml::seek_mode i_Mode = libebml::seek_beginning ) override;
  size_t write( const void* i_pData, size_t i_Size ) override;
  uint64_t getFilePointer() override;
  // Throws also for a failure before.
  void close() override;

private:
  WriterSupport::VWatchedStream m_Stream;
};

}
