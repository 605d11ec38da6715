// Writes MOV and MP4 files: one video track, one of sound where there is any, one of timecode, and an atom of our own with the attributes.
// Images and sound go from the caller's buffers to the file frame by frame; the tables stay in memory until Close writes them. A file that is
// not closed cannot be played. One file a writer, one thread at a time.
#pragma once

#include "Core/VideoInterface/WriterCapabilities.h"
#include "FileIO/MovIO/MovPrimitiveWriter.h"
#include "FileIO/MovIO/Movie.h"
#include "FileIO/WriterSupport/Essence.h"

namespace MovIO
{

// MP4 answers alike.
using VWriterCapabilities = KVZ::VContainerCapabilities<KVZ::IVideoContainer::EMOV>;

// Frame keys count from 0 without a gap; AppendKey stands for the next one. A failed write keeps its frame out of the tables, refuses all
// further frames and makes Close give false; Close still makes the frames before it playable, if it can.
class VMovWriter : public WriterSupport::VWriterBase
{
public:
  using VSpans = std::vector<KVZ::IOutputStream::VSpan>;

  static constexpr uint64_t AppendKey = ~uint64_t{ 0 };

  // Without an encoder the writer makes its own, with the software converter.
  explicit VMovWriter( KVZ::IVideoContainer::Enum i_Container, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {},
    WriterSupport::VStreamMaker i_StreamMaker = WriterSupport::MakeFile );

  const KVZ::IVideoWriterCapabilities& GetCapabilities() const override { return m_Capabilities; }
  bool IsOpen() const override { return m_pStream != nullptr; }
  // All, if the tables could not be written: nothing finds a frame without them.
  uint64_t CountIncompleteFrames() const override { return m_IncompleteFrames; }

  // For a stream that is H.264 already. The parameter sets come without start code or length, 65535 bytes at most. The first must stay the same
  // once it is set. The second belongs behind the header of such a file, and is stored before every frame that follows.
  bool SetSPS( const std::vector<uint8_t>& i_rSPS );
  bool SetPPS( const std::vector<uint8_t>& i_rPPS );
  // One frame as it is to be stored, in decoding order; of H.264 one NAL unit without start code or length. The type is 'I', 'P' or 'B'.
  bool WriteStoredFrame( const VSpans& i_rVideo, const VSpans& i_rAudio, char i_FrameType );

private:
  bool DoOpen( const std::string& i_rPath ) override;
  bool DoWriteHeader( const WriterSupport::VHeader& i_rHeader ) override;
  bool DoWriteFrame( WriterSupport::VFrame& io_rFrame ) override;
  bool DoClose() override;

  bool Describe( const WriterSupport::VHeader& i_rHeader, KVZ::VTimingRecord& o_rTiming );
  bool HasFieldsForDescription() const;
  bool SetUpTracks( uint32_t i_VideoPeriod, const KVZ::ITimecode& i_rTimecode, uint32_t& o_rTimecodeFrame );
  bool WriteStart( uint32_t i_TimecodeFrame );

  bool WriteSample( const VSpans& i_rVideo, const VSpans& i_rAudio, char i_FrameType );
  bool WriteAndEnter( const VFrameEntry& i_rEntry );
  uint64_t CollectVideo( const VSpans& i_rVideo );
  uint64_t CollectAudio( const VSpans& i_rAudio );
  bool HasSizeOfFirst( uint64_t i_Size ) const;
  bool HasRoom( uint64_t i_AudioSamples ) const;
  bool WriteTables( VMovPrimitiveWriter& io_rOut, uint64_t i_FileEnd );

  const VWriterCapabilities m_Capabilities;
  const KVZ::IVideoContainer::Enum m_Container;
  const WriterSupport::VStreamMaker m_StreamMaker;
  WriterSupport::VEssence m_Essence;

  std::shared_ptr<WriterSupport::VWatchedStream> m_pStream;
  std::unique_ptr<VMovPrimitiveWriter> m_pOut;   // on it
  VMovie m_Movie;
  uint64_t m_End = 0;   // of the media data: behind the last frame that is whole
  uint64_t m_IncompleteFrames = 0;
  std::vector<uint8_t> m_FramePrefix;
  VSpans m_Spans;   // of one frame; both kept for their memory
};

}
