// Files of 5 GiB, and of 35 GiB, on a disk that is spared: what is zero in a picture becomes a hole in the file. FFmpeg sees files of full size.
#include "Utils/UtilsIO/LargeFile.h"
#include "tests/FileIO/Containers/MovieWriters.h"
#include "tests/support/LogCapture.h"
#include "tests/support/MovParser.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>

using namespace Containers;
using namespace TestSupport;

namespace
{

constexpr uint32_t Side = 8192;
constexpr uint64_t ImageBytes = uint64_t{ Side } * Side * 2;   // 128 MiB
constexpr uint64_t HeadBytes = 64;                             // of a picture, with its number
constexpr uint32_t SamplesPerFrame = 1920;

// All zero and hardly in memory.
class VZeros : public KVZ::IBufferConst
{
public:
  explicit VZeros( size_t i_Size ) : m_pBytes( static_cast<uint8_t*>( std::calloc( i_Size, 1 ) ), &std::free ), m_Size( i_Size ) {}
  const uint8_t* Data() const override { return m_pBytes.get(); }
  size_t Size() const override { return m_Size; }

private:
  const std::unique_ptr<uint8_t, decltype( &std::free )> m_pBytes;
  const size_t m_Size;
};

// Of a long piece, which is zeros, the first and the last byte reach the disk.
class VHoleFile : public UtilsIO::VLargeFile
{
public:
  using UtilsIO::VLargeFile::Write;

  bool Write( const void* i_pData, size_t i_Size ) override
  {
    constexpr size_t Longest = 1 << 20;
    if( i_Size < Longest )
    {
      return VLargeFile::Write( i_pData, i_Size );
    }
    const auto* pBytes = static_cast<const uint8_t*>( i_pData );
    uint64_t Position = 0;
    return Tell( Position ) && VLargeFile::Write( pBytes, 1 ) && Seek( Position + i_Size - 1 ) && VLargeFile::Write( pBytes + i_Size - 1, 1 );
  }

  bool Write( const std::vector<VSpan>& i_rSpans ) override
  {
    return std::all_of( i_rSpans.begin(), i_rSpans.end(), [this]( const VSpan& i_rSpan ) { return Write( i_rSpan.first, i_rSpan.second ); } );
  }
};

std::unique_ptr<UtilsIO::IClosableStream> MakeHoleFile( const std::string& i_rPath )
{
  auto pFile = std::make_unique<VHoleFile>();
  return pFile->Open( i_rPath, UtilsIO::EOpenMode::Truncate ) ? std::move( pFile ) : nullptr;
}

struct VLargeCase
{
  VContainerRow m_Row;
  uint32_t m_Frames;
};

// Matroska's segment has a size that its field cannot hold from 32 GiB on.
constexpr VLargeCase Cases[] = { { Mov, 40 }, { MP4, 40 }, { Avi, 40 }, { Mkv, 40 }, { Mkv, 280 }, { Tvid, 40 } };

class LargeFile : public testing::TestWithParam<VLargeCase>
{
protected:
  void Write() const
  {
    const VHeader Settings = MovieHeader( Side, Side );
    const auto pZeros = std::make_shared<VZeros>( ImageBytes - HeadBytes );
    const auto pWriter = MakeWriter( GetParam().m_Row.m_Container, { MakeHoleFile } );
    ASSERT_TRUE( pWriter->Open( m_Path ) && Settings.WriteTo( *pWriter ) );
    for( uint32_t Frame = 0; Frame < GetParam().m_Frames; ++Frame )
    {
      KVZ::VBufferList Video = { Buffer( Head( Frame ) ), pZeros };
      KVZ::VBufferList Audio = { Buffer( Sound( Frame ) ) };
      ASSERT_TRUE( pWriter->WriteFrame( Video, Settings.m_Video, Audio, Settings.m_Audio, Frame ) );
    }
    ASSERT_TRUE( pWriter->Close() );
  }

  static VBytes Head( uint32_t i_Frame ) { return VBytes( HeadBytes, static_cast<uint8_t>( 1 + i_Frame % 250 ) ); }
  static VBytes Sound( uint32_t i_Frame ) { return VBytes( SamplesPerFrame * 2, static_cast<uint8_t>( 1 + i_Frame % 125 ) ); }

  // The beginning of what FFmpeg gives for a place in the file that it has sought.
  VBytes Seek( uint32_t i_Frame, const std::vector<std::string>& i_rOptions ) const
  {
    std::vector<std::string> Arguments = { "ffmpeg", "-nostdin", "-v", "error", "-ss", std::to_string( i_Frame * 0.04 ), "-i", m_Path };
    Arguments.insert( Arguments.end(), i_rOptions.begin(), i_rOptions.end() );
    const VRunResult Run = RunProgram( Arguments );
    EXPECT_EQ( Run.m_Error, "" );
    return Bytes( Run.m_Output );
  }

  const VLogCapture m_Log{ "MkvIO" };
  const VTemporaryFolder m_Folder;
  const std::string m_Path = m_Folder.File( std::string( "large." ) + GetParam().m_Row.m_pName );
};

}

TEST_P( LargeFile, IsReadToItsLastFrame )
{
  Write();
  const uint32_t Frames = GetParam().m_Frames;
  EXPECT_EQ( m_Log.Texts().size(), Frames == Cases[4].m_Frames ? 1u : 0u ) << "the size of a segment that stays marked unknown";
  ASSERT_GT( boost::filesystem::file_size( m_Path ), Frames * ImageBytes );
  for( const uint32_t Frame : { Frames - 1, Frames / 2 } )
  {
    SCOPED_TRACE( Frame );
    if( GetParam().m_Row.m_Container == Tvid.m_Container )   // which FFmpeg does not know
    {
      VTvidParser File( m_Path );
      const VTvidParser::VFrame& rFound = File.Frames().at( Frame );
      EXPECT_EQ( File.Video( { 0, rFound.m_VideoPosition, HeadBytes } ), Head( Frame ) );
      EXPECT_EQ( File.Video( { 0, rFound.m_AudioPosition, rFound.m_AudioSize } ), Sound( Frame ) );
      continue;
    }
    EXPECT_EQ( Seek( Frame, { "-map", "0:v", "-frames:v", "1", "-vf", "crop=32:1:0:0", "-pix_fmt", "uyvy422", "-f", "rawvideo", "-" } ),
      Head( Frame ) );
    const VBytes Samples = Seek( Frame, { "-map", "0:a", "-t", "0.04", "-f", "s16le", "-" } );
    EXPECT_TRUE( Samples == Sound( Frame ) ) << Samples.size();
  }
}

INSTANTIATE_TEST_SUITE_P( Containers, LargeFile, testing::ValuesIn( Cases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_Row.m_pName ) + "_" + std::to_string( i_rInfo.param.m_Frames / 8 ) + "GiB"; } );

// Its bytes are in the file by then, and the frames behind it are found all the same.
TEST( LargeMovie, AFrameOf4GiBIsRefused )
{
  const VLogCapture Log( "MovIO" );
  const VTemporaryFolder Folder;
  VHeader Settings = MovieHeader( 65535, 65535 );
  Settings.m_Video.m_PixelFormat = KVZ::IPixelFormat::EB8G8R8u8;
  const auto pZeros = std::make_shared<VZeros>( ImageBytes );
  const auto pWriter = MakeWriter( Mov.m_Container, { MakeHoleFile } );
  ASSERT_TRUE( pWriter->Open( Folder.File( "large.mov" ) ) && Settings.WriteTo( *pWriter ) );
  const auto Write = [&]( size_t i_Buffers )
  {
    KVZ::VBufferList Video( i_Buffers, pZeros );
    KVZ::VBufferList Audio = { Buffer( { 7, 8 } ) };
    return pWriter->WriteFrame( Video, Settings.m_Video, Audio, Settings.m_Audio, 0 );
  };
  EXPECT_FALSE( Write( 32 ) );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "Video frames of more than 2^32 bytes are not permitted." } );
  EXPECT_TRUE( Write( 31 ) );
  EXPECT_TRUE( pWriter->Close() );
  const auto File = VMovParser::OfFile( Folder.File( "large.mov" ) );
  EXPECT_EQ( File.Track( "vide" ).m_Samples.at( 0 ).m_Position, 52 + 32 * ImageBytes );
  EXPECT_EQ( File.Bytes( File.Track( "soun" ).m_Samples.at( 0 ) ), ( VBytes{ 7, 8 } ) );
}
