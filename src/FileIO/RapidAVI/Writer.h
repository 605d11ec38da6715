// Writes AVI files of any size (RIFF with the OpenDML extension 1.02): uncompressed or as Motion JPEG, with uncompressed sound. One file a
// writer, one thread at a time.
//
// Frames come in order. A failed write is never forgotten: it refuses all further frames and makes Close give false; Close still indexes the
// frames that are whole, if it can. Memory: 16 bytes a frame, and 16 more for each buffer of sound, of the RIFF that is being written.
#pragma once

#include "Core/VideoInterface/WriterCapabilities.h"
#include "FileIO/RapidAVI/Headers.h"
#include "FileIO/RapidAVI/Segments.h"
#include "FileIO/WriterSupport/AttributeMaps.h"
#include "FileIO/WriterSupport/Essence.h"

#include <boost/optional.hpp>

namespace RapidAVI
{

using VWriterCapabilities = KVZ::VContainerCapabilities<KVZ::IVideoContainer::EAVI>;

class VRapidAVIWriter : public WriterSupport::VWriterBase
{
public:
  // As a frame's key: the frame that comes next, whatever its number.
  static constexpr uint64_t AppendKey = ~uint64_t{ 0 };

  // Without an encoder the writer makes its own, with the software converter.
  explicit VRapidAVIWriter( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {},
    WriterSupport::VStreamMaker i_StreamMaker = WriterSupport::MakeFile, const VSegmentLimits& i_rLimits = {} );

  const KVZ::IVideoWriterCapabilities& GetCapabilities() const override { return m_Capabilities; }
  bool IsOpen() const override { return m_pOut != nullptr; }

private:
  bool DoOpen( const std::string& i_rPath ) override;
  bool DoWriteHeader( const WriterSupport::VHeader& i_rHeader ) override;
  bool DoWriteFrame( WriterSupport::VFrame& io_rFrame ) override;
  bool DoClose() override;

  VFileDescription Describe( const WriterSupport::VHeader& i_rHeader ) const;
  bool EncodeAttributes( const WriterSupport::VHeader& i_rHeader );
  bool CheckFrame( const WriterSupport::VFrame& i_rFrame ) const;
  bool CollectVideo( const WriterSupport::VFrame& i_rFrame );
  uint64_t CountSampleFrames( const KVZ::VBufferList& i_rAudio ) const;
  bool CheckCounts( uint64_t i_MoreSampleFrames ) const;
  bool WriteAttributes( VChunkWriter& io_rOut ) const;

  const VWriterCapabilities m_Capabilities;
  const WriterSupport::VStreamMaker m_StreamMaker;
  const VSegmentLimits m_Limits;
  WriterSupport::VEssence m_Essence;

  WriterSupport::VAttributeMaps m_Attributes;
  std::unique_ptr<VChunkWriter> m_pOut;
  VOpenFields m_Fields;
  boost::optional<VIndex> m_Index;
  boost::optional<VSegments> m_Segments;
  uint64_t m_AudioSampleFrames = 0;
  VSegments::VSpans m_Video;   // kept for its memory
};

}
