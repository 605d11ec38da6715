// Reads tvid files, whole ones and those that were never closed. Nothing in a file is believed before it is checked: a damaged one ends in
// one line that says what is wrong. Memory does not grow with the file, but for the index. One thread at a time.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/Streams.h"
#include "Core/VideoInterface/VideoAttributes.h"
#include "FileIO/TarvoVideo/Format.h"

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace TarvoVideo
{

// Bytes of the file.
struct VExtent
{
  uint64_t m_Position = 0;
  uint64_t m_Size = 0;
};

struct VFrameRecord
{
  uint64_t m_Key = 0;   // in a file without an index the record's number, from 0
  VExtent m_Video;
  VExtent m_Audio;   // empty in a file without audio
};

class VReader
{
public:
  // UTF-8. False with an error: nothing else may be asked then.
  bool Open( const std::string& i_rPath );
  bool Open( std::unique_ptr<KVZ::IInputStreamSeekable> i_pStream, uint64_t i_Size );

  // One line about what has failed last; empty if nothing has.
  const std::string& GetError() const { return m_Error; }

  uint64_t GetFileSize() const { return m_Size; }
  // Closed by its writer, with an index.
  bool IsFinished() const { return m_bFinished; }
  const KVZ::IVideoAttributes& GetInternalAttributes() const { return m_Internal; }
  const KVZ::IVideoAttributes& GetExternalAttributes() const { return m_External; }
  const KVZ::VideoFrameInfo& GetVideoInfo() const { return m_Video; }
  const KVZ::AudioFrameInfo& GetAudioInfo() const { return m_Audio; }

  // The frames one after another: by ascending key with an index, otherwise as they lie in the file, as many as are whole. False at the end,
  // and with an error for a record that is damaged.
  bool Next( VFrameRecord& o_rRecord );
  void Rewind();
  // Entries of the index, or whole records found by walking. False with an error; does not disturb Next.
  bool CountFrames( uint64_t& o_rCount );
  // Bytes behind the last whole record of a file without an index. Known once Next has come to the end.
  uint64_t GetTrailingBytes() const { return m_bFinished ? 0 : m_Size - m_Cursor.m_Position; }

  // Hands the bytes over in order, piece by piece. False with an error.
  bool Read( const VExtent& i_rExtent, const std::function<void( const uint8_t* i_pData, size_t i_Size )>& i_rConsumer );

private:
  struct VCursor
  {
    uint64_t m_Number = 0;
    uint64_t m_Position = 0;   // of the next record, where there is no index
  };

  bool Fail( const std::string& i_rReason );
  bool ReadAt( uint64_t i_Position, void* o_pData, size_t i_Size );
  bool ReadHeader( uint64_t& o_rIndexPosition );
  bool ReadBlock( const char* i_pName, KVZ::IVideoAttributes& o_rAttributes );
  bool ReadDescriptions();
  bool ReadIndex( uint64_t i_Position );
  bool CheckStarts();
  bool ReadIndexed( VFrameRecord& o_rRecord );
  bool ReadWalked( VFrameRecord& o_rRecord );

  std::unique_ptr<KVZ::IInputStreamSeekable> m_pStream;
  uint64_t m_Size = 0;
  std::string m_Error;
  bool m_bFinished = false;
  KVZ::IVideoAttributes m_Internal;
  KVZ::IVideoAttributes m_External;
  KVZ::VideoFrameInfo m_Video;
  KVZ::AudioFrameInfo m_Audio;
  uint64_t m_VideoBytes = 0;   // of each frame
  uint64_t m_RecordsStart = 0;
  uint64_t m_RecordsEnd = 0;
  std::vector<VIndexEntry> m_Index;
  std::vector<uint64_t> m_Starts;   // of the indexed records, ascending
  VCursor m_Cursor;
};

}
