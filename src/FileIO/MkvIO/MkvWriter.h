// Writes Matroska files, extension "mkv": video uncompressed or as JPEG images, audio uncompressed, every frame a cluster of its own, the
// attributes of the recording as tags. One file a writer, one thread at a time.
#pragma once

#include "Core/VideoInterface/WriterCapabilities.h"
#include "FileIO/WriterSupport/Essence.h"
#include "FileIO/WriterSupport/WatchedStream.h"
#include "FileIO/WriterSupport/WriterBase.h"

#include <memory>

namespace MkvIO
{

class VMkvIOCallback;
class VSegment;

using VWriterCapabilities = KVZ::VContainerCapabilities<KVZ::IVideoContainer::EMKV>;

// A frame is in the file when its call returns; a file that was never closed is read up to its last whole frame. A frame key is the number of
// the frames before it, or AppendKey. A failed write refuses all further frames and makes Close give false; Close still writes the tables over
// the frames that are whole, if it can.
class VMkvWriter : public WriterSupport::VWriterBase
{
public:
  static constexpr uint64_t AppendKey = ~uint64_t{ 0 };

  // Without an encoder the writer makes its own, with the software converter.
  explicit VMkvWriter( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {},
    WriterSupport::VStreamMaker i_StreamMaker = WriterSupport::MakeFile );
  ~VMkvWriter() override;

  const KVZ::IVideoWriterCapabilities& GetCapabilities() const override { return m_Capabilities; }
  bool IsOpen() const override { return m_pFile != nullptr; }

private:
  bool DoOpen( const std::string& i_rPath ) override;
  bool DoWriteHeader( const WriterSupport::VHeader& i_rHeader ) override;
  bool DoWriteFrame( WriterSupport::VFrame& io_rFrame ) override;
  bool DoClose() override;

  const VWriterCapabilities m_Capabilities;
  const WriterSupport::VStreamMaker m_StreamMaker;
  WriterSupport::VEssence m_Essence;
  std::unique_ptr<VMkvIOCallback> m_pFile;
  std::unique_ptr<VSegment> m_pSegment;
};

}
