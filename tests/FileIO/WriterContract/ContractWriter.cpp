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

// Of a width that suits every pixel format
VHeader HeaderOf( const VWriterRow& i_rRow )
{
  VHeader Header;
  Header.m_Video = VideoInfo( i_rRow.m_PixelFormat, 48, 4 );
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

const std::vector<VWriterRow> Writers = {
  { "TVID", "TarvoVideo", Make<TarvoVideo::VWriter>, EKeys::Any },
  { "MOV", "MovIO", MakeMovie<KVZ::IVideoContainer::EMOV>, EKeys::Counting, false },
  { "MP4", "MovIO", MakeMovie<KVZ::IVideoContainer::EMP4>, EKeys::Counting, false },
  { "AVI", "RapidAVI", Make<RapidAVI::VRapidAVIWriter> },
  { "MKV", "MkvIO", Make<MkvIO::VMkvWriter> },
  { "IMAGES", "ImageSequenceIO", Make<ImageSequenceIO::VImageSequenceWriter>, EKeys::Set, true, KVZ::IVideoPayload::EImageJPEG,
    KVZ::IPixelFormat::ER8G8B8, false, false },
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

VBytes VContractWriter::Picture( uint64_t i_Frame ) const
{
  VBytes Bytes( m_Header.ImageBytes() );
  for( size_t Byte = 0; Byte < Bytes.size(); ++Byte )
  {
    Bytes[Byte] = static_cast<uint8_t>( Byte * ( i_Frame + 3 ) + i_Frame );
  }
  return Bytes;
}

VBytes VContractWriter::Sound( uint64_t i_Frame ) const
{
  VBytes Bytes( m_Header.m_Audio.IsEmpty() ? 0 : 40 );
  for( size_t Byte = 0; Byte < Bytes.size(); ++Byte )
  {
    Bytes[Byte] = static_cast<uint8_t>( 0x80 + Byte + i_Frame * 40 );
  }
  return Bytes;
}

bool VContractWriter::WriteFrame( uint64_t i_Frame, uint64_t i_Key )
{
  KVZ::VFrameSet Frame{ Buffer( Picture( i_Frame ) ), m_Header.m_Video, {}, m_Header.m_Audio };
  if( !m_Header.m_Audio.IsEmpty() )
  {
    Frame.m_Audio.push_back( Buffer( Sound( i_Frame ) ) );
  }
  return m_pWriter->WriteFrame( Frame, i_Key );
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

}
