// A file as nested RIFF chunks: a stack of open ones, whose sizes are put in place when they are closed. One thread at a time.
//
// Failures stick in the stream: write straight on, ask once. What was opened and written since a mark can be given up.
#pragma once

#include "FileIO/RapidAVI/Format.h"
#include "FileIO/WriterSupport/WatchedStream.h"

#include <boost/container/static_vector.hpp>
#include <boost/optional.hpp>

#include <limits>

namespace RapidAVI
{

constexpr uint64_t LargestChunk = std::numeric_limits<uint32_t>::max();   // bytes of content

class VChunkWriter : public WriterSupport::VWatchedStream
{
public:
  struct VOpenChunk
  {
    uint64_t m_Position;   // of the header
    boost::optional<uint32_t> m_KnownSize;
  };
  using VStack = boost::container::static_vector<VOpenChunk, 8>;

  // A place in the file and what is open there.
  struct VMark
  {
    VStack m_Stack;
    uint64_t m_Position = 0;
  };

  using VWatchedStream::VWatchedStream;

  bool OpenRiff( VFourCC i_Form ) { return OpenForm( FourCC( "RIFF" ), i_Form ); }
  bool OpenList( VFourCC i_Type ) { return OpenForm( FourCC( "LIST" ), i_Type ); }
  // Of a size that is known; CloseChunk asserts it.
  bool OpenChunk( VFourCC i_Id, uint32_t i_Size );
  // Of a size that shows when it is closed.
  bool OpenChunk( VFourCC i_Id );
  // The innermost, padded to an even length. False, with a line in the log, for content that is too long for a chunk.
  bool CloseChunk();
  // The innermost is taken as closed, whatever it holds.
  void LeaveChunk() { m_Stack.pop_back(); }

  size_t CountOpen() const { return m_Stack.size(); }

  // Zeros from here on.
  bool Reserve( size_t i_Bytes );

  // False if the place is not known.
  bool GetMark( VMark& o_rMark );
  // Gives up what came after the mark. What has failed is not forgotten by that.
  bool GoBack( const VMark& i_rMark );

private:
  bool OpenForm( VFourCC i_Id, VFourCC i_Form );
  bool Push( VFourCC i_Id, boost::optional<uint32_t> i_KnownSize );
  bool IsStatedSize( const VOpenChunk& i_rChunk, uint64_t i_Size ) const;
  bool PatchSize( const VOpenChunk& i_rChunk, uint64_t i_End, uint64_t i_Size );

  VStack m_Stack;
};

// A chunk that stays open as long as the scope. One that ends without Close has met a failure: the chunk is left as it is.
class VChunkScope
{
public:
  VChunkScope( VChunkWriter& io_rOut, VFourCC i_Id, uint32_t i_Size ) : m_rOut( io_rOut ), m_bOpen( io_rOut.OpenChunk( i_Id, i_Size ) ) {}
  static VChunkScope List( VChunkWriter& io_rOut, VFourCC i_Type ) { return VChunkScope( io_rOut, io_rOut.OpenList( i_Type ) ); }
  static VChunkScope Riff( VChunkWriter& io_rOut, VFourCC i_Form ) { return VChunkScope( io_rOut, io_rOut.OpenRiff( i_Form ) ); }
  ~VChunkScope()
  {
    if( m_bOpen )
    {
      m_rOut.LeaveChunk();
    }
  }
  VChunkScope( const VChunkScope& ) = delete;
  VChunkScope& operator=( const VChunkScope& ) = delete;

  // False also if it could not be opened.
  bool Close()
  {
    const bool bClosed = m_bOpen && m_rOut.CloseChunk();
    m_bOpen = m_bOpen && !bClosed;
    return bClosed;
  }

private:
  VChunkScope( VChunkWriter& io_rOut, bool i_bOpen ) : m_rOut( io_rOut ), m_bOpen( i_bOpen ) {}

  VChunkWriter& m_rOut;
  bool m_bOpen;
};

}
