#include "Utils/UtilsIO/LargeFile.h"
#include "tests/support/FileSizeLimit.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <numeric>

#include <fcntl.h>
#include <sys/stat.h>

using UtilsIO::EOpenMode;
using UtilsIO::VLargeFile;

namespace
{

class LargeFile : public testing::Test
{
protected:
  std::string Contents()
  {
    VLargeFile Reader;
    EXPECT_TRUE( Reader.Open( m_Path, EOpenMode::Read ) );
    std::string Bytes( Reader.GetSize(), '\0' );
    EXPECT_TRUE( Reader.Read( Bytes.data(), Bytes.size() ) );
    return Bytes;
  }

  const TestSupport::VTemporaryFolder m_Folder;
  const std::string m_Path = m_Folder.File( "Aufnahme ä.bin" );
  VLargeFile m_File;
};

}

TEST_F( LargeFile, ModesDoWithAnExistingFileWhatTheirNamesSay )
{
  EXPECT_FALSE( m_File.Open( m_Path, EOpenMode::Read ) );
  EXPECT_FALSE( m_File.Open( m_Path, EOpenMode::ReadWrite ) );
  ASSERT_TRUE( m_File.Open( m_Path, EOpenMode::Truncate ) );
  EXPECT_FALSE( m_File.Open( m_Folder.File( "other" ), EOpenMode::Truncate ) ) << "the first file stays open";
  EXPECT_TRUE( m_File.Write( "abc", 3 ) );
  char Byte = 0;
  EXPECT_FALSE( m_File.Read( &Byte, 1 ) );
  EXPECT_TRUE( m_File.Close() );
  EXPECT_FALSE( m_File.Close() );

  ASSERT_TRUE( m_File.Open( m_Path, EOpenMode::CreateReadWrite ) );
  EXPECT_EQ( m_File.GetSize(), 3u );
  EXPECT_TRUE( m_File.Write( "X", 1 ) );
  m_File.Close();
  ASSERT_TRUE( m_File.Open( m_Path, EOpenMode::ReadWrite ) );
  EXPECT_TRUE( m_File.Seek( 2 ) && m_File.Write( "Y", 1 ) );
  m_File.Close();
  EXPECT_EQ( Contents(), "XbY" );
  ASSERT_TRUE( m_File.Open( m_Path, EOpenMode::TruncateReadWrite ) );
  EXPECT_EQ( m_File.GetSize(), 0u );
  m_File.Close();
  EXPECT_EQ( Contents(), "" );
}

TEST_F( LargeFile, AFailedTransferSticksUntilASeek )
{
  ASSERT_TRUE( m_File.Open( m_Path, EOpenMode::TruncateReadWrite ) );
  ASSERT_TRUE( m_File.Write( "abc", 3 ) && m_File.Seek( 1 ) );
  char Bytes[4] = {};
  EXPECT_FALSE( m_File.Read( Bytes, 4 ) );
  EXPECT_TRUE( m_File.IsEnd() );
  EXPECT_FALSE( m_File.IsGood() );
  EXPECT_FALSE( m_File.Write( Bytes, 0 ) );
  EXPECT_FALSE( m_File.Write( { { Bytes, 1 } } ) );
  ASSERT_TRUE( m_File.Seek( 1 ) );
  EXPECT_FALSE( m_File.IsEnd() );
  EXPECT_TRUE( m_File.Write( Bytes, 0 ) );

  size_t Count = 0;
  EXPECT_TRUE( m_File.ReadBlock( Bytes, 4, Count ) );
  EXPECT_EQ( Count, 2u );
  EXPECT_TRUE( m_File.IsGood() && m_File.IsEnd() );
}

// More pieces than one system call takes, some empty, so that gathered writes are put together from several.
TEST_F( LargeFile, AGatheredWriteIsTheSameAsItsPieces )
{
  std::vector<uint8_t> Source( 200'000 );
  std::iota( Source.begin(), Source.end(), uint8_t{ 0 } );
  std::vector<VLargeFile::VSpan> Spans;
  size_t Position = 0;
  for( size_t Piece = 0; Piece < 150; ++Piece )
  {
    const size_t Size = Piece % 7 == 0 ? 0 : Piece * 11;
    Spans.emplace_back( Source.data() + Position, Size );
    Position += Size;
  }
  ASSERT_TRUE( m_File.Open( m_Path, EOpenMode::Truncate ) );
  EXPECT_TRUE( m_File.Write( Spans ) );
  EXPECT_TRUE( m_File.Write( std::vector<VLargeFile::VSpan>{ { nullptr, 0 } } ) );
  m_File.Close();
  EXPECT_EQ( Contents(), std::string( Source.begin(), Source.begin() + static_cast<std::ptrdiff_t>( Position ) ) );
}

TEST_F( LargeFile, PositionsBeyond4GiBAreNotWrapped )
{
  constexpr uint64_t Far = ( uint64_t{ 5 } << 30 ) + 3;
  ASSERT_TRUE( m_File.Open( m_Path, EOpenMode::TruncateReadWrite ) );
  ASSERT_TRUE( m_File.Seek( Far ) && m_File.Write( "end", 3 ) );
  uint64_t Position = 0;
  EXPECT_TRUE( m_File.Tell( Position ) );
  EXPECT_EQ( Position, Far + 3 );
  m_File.Close();

  ASSERT_TRUE( m_File.Open( m_Path, EOpenMode::Read ) );
  EXPECT_EQ( m_File.GetSize(), Far + 3 );
  char Bytes[3] = {};
  EXPECT_TRUE( m_File.Seek( Far ) && m_File.Read( Bytes, 3 ) );
  EXPECT_EQ( std::string( Bytes, 3 ), "end" );
  EXPECT_FALSE( m_File.Seek( ~uint64_t{ 0 } ) );
}

TEST_F( LargeFile, AFullDiskFailsInTheVeryWriteThatMeetsIt )
{
  ASSERT_TRUE( m_File.Open( "/dev/full", EOpenMode::ReadWrite ) );
  EXPECT_FALSE( m_File.Write( "a", 1 ) );
  EXPECT_FALSE( m_File.IsGood() );
  m_File.Close();

  const TestSupport::VFileSizeLimit Limit( 100 );
  ASSERT_TRUE( m_File.Open( m_Path, EOpenMode::Truncate ) );
  const std::string Bytes( 70, 'x' );
  EXPECT_TRUE( m_File.Write( Bytes.data(), Bytes.size() ) );
  // The system takes 30 bytes of it first.
  EXPECT_FALSE( m_File.Write( { { Bytes.data(), 20 }, { Bytes.data(), 50 } } ) );
  uint64_t Position = 0;
  EXPECT_TRUE( m_File.Tell( Position ) );
  EXPECT_EQ( Position, 100u );
  EXPECT_TRUE( m_File.Seek( 0 ) && m_File.Write( "y", 1 ) );
}
