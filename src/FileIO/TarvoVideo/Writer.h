// Writes the system's own container, extension "tvid": every field of the frame description and an open list of attributes are kept, video
// uncompressed, frames found by key. One file a writer, one thread at a time.
#pragma once

#include "Core/VideoInterface/WriterCapabilities.h"
#include "FileIO/WriterSupport/Essence.h"
#include "FileIO/WriterSupport/WatchedStream.h"
#include "FileIO/WriterSupport/WriterBase.h"

#include <map>
#include <memory>
#include <vector>

namespace TarvoVideo
{

using VWriterCapabilities = KVZ::VContainerCapabilities<KVZ::IVideoContainer::ETVID>;

// A frame's record is written in the order of the calls; a key that comes again replaces its record in place, which needs the same size.
// A failed write keeps its frame out of the index, refuses all further frames and makes Close give false; Close still writes the index
// of the frames that are whole, if it can.
class VWriter : public WriterSupport::VWriterBase
{
public:
  // Without an encoder the writer makes its own, with the software converter.
  explicit VWriter( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {},
    WriterSupport::VStreamMaker i_StreamMaker = WriterSupport::MakeFile );

  const KVZ::IVideoWriterCapabilities& GetCapabilities() const override { return m_Capabilities; }
  bool IsOpen() const override { return m_pStream != nullptr; }
  uint64_t CountIncompleteFrames() const override { return m_IncompleteFrames; }

private:
  using VSpans = std::vector<KVZ::IOutputStream::VSpan>;

  struct VRecord
  {
    uint64_t m_Position;
    uint32_t m_AudioBytes;
  };

  bool DoOpen( const std::string& i_rPath ) override;
  bool DoWriteHeader( const WriterSupport::VHeader& i_rHeader ) override;
  bool DoWriteFrame( WriterSupport::VFrame& io_rFrame ) override;
  bool DoClose() override;

  bool WriteInternalBlock();
  bool WriteExternalBlock( const WriterSupport::VHeader& i_rHeader );
  void CollectSpans( const WriterSupport::VFrame& i_rFrame, const uint32_t* i_pAudioLength );
  bool FitsDescription( const WriterSupport::VFrame& i_rFrame, uint64_t i_AudioBytes ) const;
  bool WriteIndex( WriterSupport::VWatchedStream& io_rStream ) const;

  const VWriterCapabilities m_Capabilities;
  const WriterSupport::VStreamMaker m_StreamMaker;
  WriterSupport::VEssence m_Essence;

  std::unique_ptr<WriterSupport::VWatchedStream> m_pStream;
  std::map<uint64_t, VRecord> m_Index;
  uint64_t m_IncompleteFrames = 0;   // without their sound
  VSpans m_VideoSpans;               // both kept for their memory
  VSpans m_AudioSpans;
};

}
