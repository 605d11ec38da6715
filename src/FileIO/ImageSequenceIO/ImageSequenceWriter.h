// Writes each frame as an image file of its own in one folder, and beside them a side file that keeps the attributes. No audio.
//
// The path given to Open is the folder, which is made where it is missing, and the pattern of the file names (see FileNames.h); the payload's
// extension is put behind every name. No file stays open between calls: once the header is written, WriteFrame may be called by several
// threads at once, for different frame keys and in any order. The other operations are for one thread at a time.
#pragma once

#include "Core/VideoInterface/WriterCapabilities.h"
#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "FileIO/WriterSupport/AttributeMaps.h"
#include "FileIO/WriterSupport/WatchedStream.h"
#include "FileIO/WriterSupport/WriterBase.h"

#include <memory>
#include <string>

namespace ImageSequenceIO
{

using VWriterCapabilities = KVZ::VContainerCapabilities<KVZ::IVideoContainer::EIMAGES>;

// A frame's file is made even where its encoding fails; a frame that failed leaves what was written of it. The key is part of the name, so
// it must be set, and a key that comes again replaces its file.
class VImageSequenceWriter : public WriterSupport::VWriterBase
{
public:
  // Without an encoder the writer makes its own, with the software converter.
  explicit VImageSequenceWriter( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {},
    WriterSupport::VStreamMaker i_StreamMaker = WriterSupport::MakeFile );

  const KVZ::IVideoWriterCapabilities& GetCapabilities() const override { return m_Capabilities; }
  bool IsOpen() const override { return !m_Folder.empty() && !m_Pattern.empty(); }

private:
  bool DoOpen( const std::string& i_rPath ) override;
  bool DoWriteHeader( const WriterSupport::VHeader& i_rHeader ) override;
  bool DoWriteFrame( WriterSupport::VFrame& io_rFrame ) override;
  bool DoClose() override;

  bool EncodeAttributes( const WriterSupport::VHeader& i_rHeader );
  bool WriteSideFile() const;
  bool WriteFile( const std::string& i_rPath, const KVZ::VBufferList& i_rBuffers ) const;
  std::string FramePath( uint64_t i_FrameKey, const char* i_pExtension ) const;

  // Fixed after construction
  const VWriterCapabilities m_Capabilities;
  const WriterSupport::VStreamMaker m_StreamMaker;
  const std::shared_ptr<KVZ::IBufferAllocator> m_pAllocator;
  const std::shared_ptr<VideoEncoding::VVideoFrameEncoder> m_pEncoder;

  // Set by Open and WriteHeader, read by every thread afterwards
  std::string m_Folder;
  std::string m_Pattern;
  KVZ::IVideoPayload::Enum m_VideoPayload = KVZ::IVideoPayload::ENone;
  KVZ::VideoFrameInfo m_Video;   // as stored
  KVZ::VTimingRecord m_Timing;
  KVZ::ITimecode m_StartTimecode;
  WriterSupport::VAttributeMaps m_Attributes;
};

}
