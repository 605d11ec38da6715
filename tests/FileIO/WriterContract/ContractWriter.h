// The writers of all containers, one row each, and what their common tests need: a writer into memory and frames that suit it.
#pragma once

#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "tests/FileIO/WriterContract/FoundFrames.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SmallRecording.h"

#include <gtest/gtest.h>

#include <map>
#include <memory>
#include <string>
#include <vector>

namespace WriterContract
{

using namespace TestSupport;

enum class EKeys
{
  Any,        // every number is a key
  Counting,   // the number of the frames before it, or AppendKey
  Set         // every number but AppendKey
};

struct VWriterRow
{
  using VMaker = std::shared_ptr<KVZ::IVideoWriter> ( * )( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder,
    WriterSupport::VStreamMaker i_StreamMaker );

  const char* m_pName;
  const char* m_pCategory;
  VMaker m_Make;
  EKeys m_Keys = EKeys::Counting;
  bool m_bTellsFailedOpen = true;
  // What the recordings of the tests are
  KVZ::IVideoPayload::Enum m_Payload = KVZ::IVideoPayload::EUncompressed;
  KVZ::IPixelFormat::Enum m_PixelFormat = KVZ::IPixelFormat::EU8Y8V8Y8;
  bool m_bAudio = true;
  bool m_bOneFile = true;   // otherwise a file a frame, none of which stays open
  // Of the one file
  std::optional<VFound> ( *m_Read )( const VBytes& i_rBytes ) = nullptr;
  bool m_bReadableUnfinished = true;
};

extern const std::vector<VWriterRow> Writers;

void PrintTo( const VWriterRow& i_rRow, std::ostream* o_pText );

// A writer of a row. All its files are in memory, each with its name, and all fail together where the fault is.
class VContractWriter
{
public:
  explicit VContractWriter( const VWriterRow& i_rRow, const VFault& i_rFault = {} );

  KVZ::IVideoWriter& Writer() { return *m_pWriter; }
  const std::map<std::string, std::shared_ptr<VBytes>>& Files() const { return m_Files; }
  uint64_t Operations() const { return m_Operations; }
  const VHeader& Header() const { return m_Header; }

  // A path may be without a folder
  bool Open() { return m_pWriter->Open( "movie%FRAME%" ); }
  bool Begin() { return Open() && m_Header.WriteTo( *m_pWriter ); }

  // Picture and sound of a frame's number, alike in every run.
  VBytes Picture( uint64_t i_Frame ) const;
  VBytes Sound( uint64_t i_Frame ) const;
  bool WriteFrame( uint64_t i_Frame, uint64_t i_Key );
  bool WriteFrame( uint64_t i_Frame ) { return WriteFrame( i_Frame, i_Frame ); }

  // Whether these bytes lie somewhere in a file, one after another.
  bool Holds( const VBytes& i_rBytes ) const;

private:
  const VHeader m_Header;
  std::map<std::string, std::shared_ptr<VBytes>> m_Files;
  uint64_t m_Operations = 0;
  std::shared_ptr<KVZ::IVideoWriter> m_pWriter;
};

class WriterContract : public testing::TestWithParam<VWriterRow>
{
protected:
  const VLogCapture m_Log{ GetParam().m_pCategory };
};

// Of the writers of one file.
class FailingStream : public WriterContract
{
};

}
