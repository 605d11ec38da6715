#include "tests/FileIO/WriterContract/ContractWriter.h"

#include "FileIO/ImageSequenceIO/ImageSequenceWriter.h"
#include "FileIO/MkvIO/MkvWriter.h"
#include "FileIO/MovIO/MovWriter.h"
#include "FileIO/RapidAVI/Writer.h"
#include "FileIO/TarvoVideo/Writer.h"
#include "FileIO/VideoEncoding/ImageCompressors.h"
#include "tests/support/MemoryFile.h"

#include <algorithm>
#include <ostream>

namespace WriterContract
{

namespace
{

using VEncoder = std::shared_ptr<VideoEncoding::VVideoFrameEncoder>;

template<class TWriter>
std::shared_ptr<KVZ::IVideoWriter> Make( VEncoder i_pEncoder, WriterSupport::VStreamMaker i_StreamMaker )
{
  return std::make_shared<TWriter>( std::move( i_pEncoder ), std::move( i_StreamMaker ) );
}

template<KVZ::IVideoContainer::Enum Container>
std::shared_ptr<KVZ::IVideoWriter> MakeMovie( VEncoder i_pEncoder, WriterSupport::VStreamMaker i_StreamMaker )
{
  return std::make_shared<MovIO::VMovWriter>( Container, std::move( i_pEncoder ), std::move( i_StreamMaker ) );
}

// With several RIFFs in a file of a few frames
std::shared_ptr<KVZ::IVideoWriter> MakeAvi( VEncoder i_pEncoder, WriterSupport::VStreamMaker i_StreamMaker )
{
  return std::make_shared<RapidAVI::VRapidAVIWriter>( std::move( i_pEncoder ), std::move( i_StreamMaker ), RapidAVI::VSegmentLimits{ 900, 900 } );
}

VHeader HeaderOf( const VWriterRow& i_rRow )
{
  VHeader Header;
  Header.m_Video = VideoInfo( i_rRow.m_PixelFormat, Width, Height );
  Header.m_Audio = i_rRow.m_bAudio ? KVZ::AudioFrameInfo{ KVZ::IAudioSampleFormat::EInt16, 48000, 2 } : KVZ::AudioFrameInfo();
  Header.m_Timecode = { KVZ::ITimecodeStandard::ETimecode25, 1, 2, 3, 4 };
  Header.m_Payload = i_rRow.m_Payload;
  return Header;
}

VEncoder MakeEncoder()
{
  VideoEncoding::VEncoderParts Parts;
  Parts.m_Compressors = VideoEncoding::ImageCompressors();
  return std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software, Parts );
}

}

using KVZ::IVideoContainer;

const std::vector<VWriterRow> Writers = {
  { .m_pName = "TVID", .m_pCategory = "TarvoVideo", .m_Make = Make<TarvoVideo::VWriter>, .m_Keys = EKeys::Any, .m_Read = ReadTvid },
  { .m_pName = "MOV",
    .m_pCategory = "MovIO",
    .m_Make = MakeMovie<IVideoContainer::EMOV>,
    .m_bTellsFailedOpen = false,
    .m_Read = ReadMov,
    .m_bReadableUnfinished = false },
  { .m_pName = "MP4",
    .m_pCategory = "MovIO",
    .m_Make = MakeMovie<IVideoContainer::EMP4>,
    .m_bTellsFailedOpen = false,
    .m_Read = ReadMov,
    .m_bReadableUnfinished = false },
  { .m_pName = "AVI", .m_pCategory = "RapidAVI", .m_Make = MakeAvi, .m_Read = ReadAvi },
  { .m_pName = "MKV", .m_pCategory = "MkvIO", .m_Make = Make<MkvIO::VMkvWriter>, .m_Read = ReadMkv },
  { .m_pName = "IMAGES",
    .m_pCategory = "ImageSequenceIO",
    .m_Make = Make<ImageSequenceIO::VImageSequenceWriter>,
    .m_Keys = EKeys::Set,
    .m_Payload = KVZ::IVideoPayload::EImageJPEG,
    .m_PixelFormat = KVZ::IPixelFormat::ER8G8B8,
    .m_bAudio = false,
    .m_bOneFile = false },
};

void PrintTo( const VWriterRow& i_rRow, std::ostream* o_pText ) { *o_pText << i_rRow.m_pName; }

VContractWriter::VContractWriter( const VWriterRow& i_rRow, const VFault& i_rFault )
  : m_Header( HeaderOf( i_rRow ) ),
    m_pWriter( i_rRow.m_Make( MakeEncoder(),
      [this, i_rFault]( const std::string& i_rPath )
      {
        auto& rpBytes = m_Files[i_rPath];
        rpBytes = std::make_shared<VBytes>();
        return std::make_unique<VFailingStream>( std::make_unique<VMemoryFile>( rpBytes ), i_rFault, &m_Operations );
      } ) )
{
}

VBytes VContractWriter::Picture( uint64_t i_Frame ) const { return Noise( m_Header.ImageBytes(), static_cast<uint32_t>( i_Frame ) ); }

VBytes VContractWriter::Sound( uint64_t i_Frame ) const
{
  return Noise( m_Header.m_Audio.IsEmpty() ? 0 : SoundBytes, static_cast<uint32_t>( 1000 + i_Frame ) );
}

bool VContractWriter::WriteFrame( uint64_t i_Frame, uint64_t i_Key )
{
  return m_Header.WriteFrame( *m_pWriter, Picture( i_Frame ), Sound( i_Frame ), i_Key );
}

bool VContractWriter::Holds( const VBytes& i_rBytes ) const
{
  return std::any_of( m_Files.begin(), m_Files.end(),
    [&]( const auto& i_rFile )
    {
      const VBytes& rFile = *i_rFile.second;
      return std::search( rFile.begin(), rFile.end(), i_rBytes.begin(), i_rBytes.end() ) != rFile.end();
    } );
}

INSTANTIATE_TEST_SUITE_P( All, WriterContract, testing::ValuesIn( Writers ), testing::PrintToStringParamName() );
INSTANTIATE_TEST_SUITE_P( All, FailingStream, testing::ValuesIn( Writers.begin(), Writers.end() - 1 ), testing::PrintToStringParamName() );

}
