#include "tests/FileIO/Containers/MovieWriters.h"

#include "FileIO/ImageSequenceIO/ImageSequenceWriter.h"
#include "FileIO/MkvIO/MkvWriter.h"
#include "FileIO/MovIO/MovWriter.h"
#include "FileIO/RapidAVI/Writer.h"
#include "FileIO/TarvoVideo/Writer.h"
#include "FileIO/VideoEncoding/ImageCompressors.h"

namespace Containers
{

std::shared_ptr<KVZ::IVideoWriter> MakeWriter( KVZ::IVideoContainer::Enum i_Container, VWriterParts i_Parts )
{
  VideoEncoding::VEncoderParts EncoderParts;
  EncoderParts.m_Compressors = VideoEncoding::ImageCompressors();
  const auto pEncoder = i_Parts.m_bCompressors
    ? std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software, EncoderParts )
    : nullptr;
  const auto Limits = i_Parts.m_RiffBytes == 0 ? RapidAVI::VSegmentLimits() : RapidAVI::VSegmentLimits{ i_Parts.m_RiffBytes, i_Parts.m_RiffBytes };
  switch( i_Container )
  {
    case KVZ::IVideoContainer::EMOV:
    case KVZ::IVideoContainer::EMP4: return std::make_shared<MovIO::VMovWriter>( i_Container, pEncoder, std::move( i_Parts.m_StreamMaker ) );
    case KVZ::IVideoContainer::EAVI: return std::make_shared<RapidAVI::VRapidAVIWriter>( pEncoder, std::move( i_Parts.m_StreamMaker ), Limits );
    case KVZ::IVideoContainer::EMKV: return std::make_shared<MkvIO::VMkvWriter>( pEncoder, std::move( i_Parts.m_StreamMaker ) );
    case KVZ::IVideoContainer::EIMAGES:
      return std::make_shared<ImageSequenceIO::VImageSequenceWriter>( pEncoder, std::move( i_Parts.m_StreamMaker ) );
    default: return std::make_shared<TarvoVideo::VWriter>( pEncoder, std::move( i_Parts.m_StreamMaker ) );
  }
}

TestSupport::VHeader MovieHeader( uint32_t i_Width, uint32_t i_Height )
{
  TestSupport::VHeader Header;
  Header.m_Video = TestSupport::VideoInfo( KVZ::IPixelFormat::EU8Y8V8Y8, i_Width, i_Height );
  Header.m_Timecode = { KVZ::ITimecodeStandard::ETimecode25, 1 };
  return Header;
}

}
