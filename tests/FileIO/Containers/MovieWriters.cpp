#include "tests/FileIO/Containers/MovieWriters.h"

#include "FileIO/MkvIO/MkvWriter.h"
#include "FileIO/MovIO/MovWriter.h"
#include "FileIO/RapidAVI/Writer.h"
#include "FileIO/TarvoVideo/Writer.h"

namespace Containers
{

std::shared_ptr<KVZ::IVideoWriter> MakeWriter( KVZ::IVideoContainer::Enum i_Container, WriterSupport::VStreamMaker i_StreamMaker,
  uint64_t i_RiffBytes )
{
  const auto Limits = i_RiffBytes == 0 ? RapidAVI::VSegmentLimits() : RapidAVI::VSegmentLimits{ i_RiffBytes, i_RiffBytes };
  switch( i_Container )
  {
    case KVZ::IVideoContainer::EMOV:
    case KVZ::IVideoContainer::EMP4: return std::make_shared<MovIO::VMovWriter>( i_Container, nullptr, std::move( i_StreamMaker ) );
    case KVZ::IVideoContainer::EAVI: return std::make_shared<RapidAVI::VRapidAVIWriter>( nullptr, std::move( i_StreamMaker ), Limits );
    case KVZ::IVideoContainer::EMKV: return std::make_shared<MkvIO::VMkvWriter>( nullptr, std::move( i_StreamMaker ) );
    default: return std::make_shared<TarvoVideo::VWriter>( nullptr, std::move( i_StreamMaker ) );
  }
}

std::shared_ptr<const KVZ::IBufferConst> Buffer( VBytes i_Bytes )
{
  auto pBuffer = std::make_shared<KVZ::IStandardBuffer>();
  pBuffer->Bytes() = std::move( i_Bytes );
  return pBuffer;
}

VRecordingSettings::VRecordingSettings( uint32_t i_Width, uint32_t i_Height )
{
  m_Video.m_ImageWidth = i_Width;
  m_Video.m_ImageHeight = i_Height;
  m_Video.m_PixelFormat = KVZ::IPixelFormat::EU8Y8V8Y8;
  m_Video.m_PixelAspectRatio = 1.0;
  m_Video.m_InterlacedFormat = KVZ::IInterlacedFormat::ENotInterlaced;
}

bool VRecordingSettings::WriteHeader( KVZ::IVideoWriter& io_rWriter ) const
{
  return io_rWriter.WriteHeader( m_Video, m_Audio, m_Timing, m_Timecode, m_Colour, m_Attributes, KVZ::IVideoPayload::EUncompressed,
    KVZ::IAudioPayload::EUncompressed );
}

}
