#include "tests/FileIO/TarvoVideo/SmallFile.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SparseFile.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace TarvoVideo;
using namespace TestSupport;

namespace
{

VBytes ExpectedFile()
{
  VLittleEndian File;
  File.Raw( "###TarvoVideoFile###" ).U32( 0x9F31C19C ).U32( 1 ).U32( 2 ).U64( 1 );   // fixed header
  File.U64( 597 );                                                                   // position of the index
  File.U32( 13 );                                                                    // internal block: entries
  File.Text( "AudioFrameInfo.Channels" ).U32( 7 ).U32( 1 );
  File.Text( "AudioFrameInfo.Present" ).U32( 0 ).U8( 1 );
  File.Text( "AudioFrameInfo.SampleFormat" ).U32( 11 ).Text( "Int16" );
  File.Text( "AudioFrameInfo.SampleRate" ).U32( 7 ).U32( 48000 );
  File.Text( "VideoFrameInfo.ImageHeight" ).U32( 7 ).U32( 1 );
  File.Text( "VideoFrameInfo.ImageWidth" ).U32( 7 ).U32( 4 );
  File.Text( "VideoFrameInfo.ImageX" ).U32( 7 ).U32( 0 );
  File.Text( "VideoFrameInfo.ImageY" ).U32( 7 ).U32( 0 );
  File.Text( "VideoFrameInfo.InterlacedFormat" ).U32( 11 ).Text( "NotInterlaced" );
  File.Text( "VideoFrameInfo.Inverted" ).U32( 0 ).U8( 0 );
  File.Text( "VideoFrameInfo.PixelAspectRatio" ).U32( 10 ).Double( 1.0 );
  File.Text( "VideoFrameInfo.PixelFormat" ).U32( 11 ).Text( "Luminance8" );
  File.Text( "VideoFrameInfo.Present" ).U32( 0 ).U8( 1 );
  File.U32( 1 ).Text( "Take" ).U32( 11 ).Text( "one" );   // external block
  EXPECT_EQ( File.m_Bytes.size(), 577u );
  File.Raw( "ABCD" ).U32( 4 ).Raw( "abcd" );   // record of key 7: video, audio length, audio
  File.Raw( "EFGH" ).U32( 0 );                 // record of key 3
  File.U64( 2 );                               // index: entries
  File.U64( 3 ).U64( 589 );                    // key, position
  File.U64( 7 ).U64( 577 );
  return File.m_Bytes;
}

class TarvoWriter : public testing::Test
{
protected:
  VReader& Read()
  {
    EXPECT_TRUE( m_Reader.Open( std::make_unique<ISimpleInputStreamAdapter>( *m_File.m_pBytes ), m_File.m_pBytes->size() ) ) << m_Reader.GetError();
    return m_Reader;
  }

  IVideoAttributes WriteEmpty( const VTimingRecord& i_rTiming, const ITimecode& i_rTimecode, const IVideoAttributes& i_rAttributes )
  {
    VHeader& rHeader = m_File.m_Header;
    rHeader.m_Audio = {};
    rHeader.m_Timing = i_rTiming;
    rHeader.m_Timecode = i_rTimecode;
    rHeader.m_Colour = { 0.5f, 2.0f };
    rHeader.m_Attributes = i_rAttributes;
    EXPECT_TRUE( m_File.Begin() && m_File.m_Writer.Close() );
    return Read().GetExternalAttributes();
  }

  const VLogCapture m_Log{ "TarvoVideo" };
  VSmallFile m_File;
  VReader m_Reader;
};

}

TEST_F( TarvoWriter, ASmallFileIsTheseBytes )
{
  ASSERT_TRUE( m_File.Begin() );
  ASSERT_TRUE( m_File.WriteFrame( 7, { Bytes( "ABCD" ), Bytes( "abcd" ) } ) );
  ASSERT_TRUE( m_File.WriteFrame( 3, { Bytes( "EFGH" ), {} } ) );
  ASSERT_TRUE( m_File.m_Writer.Close() );
  EXPECT_EQ( *m_File.m_pBytes, ExpectedFile() );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( TarvoWriter, AKeyWrittenAgainReplacesItsRecordInPlace )
{
  ASSERT_TRUE( m_File.Begin() );
  ASSERT_TRUE( m_File.WriteFrame( 0, { Bytes( "ABCD" ), Bytes( "ab" ) } ) );
  ASSERT_TRUE( m_File.WriteFrame( 1, { Bytes( "EFGH" ), Bytes( "ef" ) } ) );
  EXPECT_TRUE( m_File.WriteFrame( 0, { Bytes( "IJKL" ), Bytes( "ij" ) } ) );
  // One that does not fit its place is refused and spoils nothing.
  EXPECT_FALSE( m_File.WriteFrame( 0, { Bytes( "MNOP" ), Bytes( "mnop" ) } ) );
  EXPECT_TRUE( m_File.WriteFrame( 2, { Bytes( "QRST" ), Bytes( "qr" ) } ) );
  EXPECT_TRUE( m_File.m_Writer.Close() );
  const VContents Expected{ { 0, { Bytes( "IJKL" ), Bytes( "ij" ) } }, { 1, { Bytes( "EFGH" ), Bytes( "ef" ) } },
    { 2, { Bytes( "QRST" ), Bytes( "qr" ) } } };
  EXPECT_EQ( ReadAll( *m_File.m_pBytes ).m_Frames, Expected );
}

TEST_F( TarvoWriter, AFrameThatIsNotWhatTheHeaderSaysIsRefusedWithBothSizes )
{
  ASSERT_TRUE( m_File.Begin() );
  const size_t Before = m_File.m_pBytes->size();
  EXPECT_FALSE( m_File.WriteFrame( 5, { Bytes( "ABC" ), {} } ) );
  EXPECT_EQ( m_Log.Texts().back(), "Frame 5 of 4 x 1 pixels and 3 bytes does not fit the file's 4 x 1 pixels and 4 bytes." );
  VHeader Colour = m_File.m_Header;
  Colour.m_Video.m_PixelFormat = IPixelFormat::ER8G8B8;
  EXPECT_FALSE( Colour.WriteFrame( m_File.m_Writer, VBytes( 12 ), {}, 5 ) );
  EXPECT_EQ( m_Log.Texts().back(), "Encoding to 'Uncompressed' failed." );
  EXPECT_EQ( m_File.m_pBytes->size(), Before );
  EXPECT_TRUE( m_File.WriteFrame( 5, { Bytes( "ABCD" ), {} } ) );
  EXPECT_TRUE( m_File.m_Writer.Close() );
  EXPECT_EQ( ReadAll( *m_File.m_pBytes ).m_Frames.size(), 1u );
}

TEST_F( TarvoWriter, WithDefaultTimingTheColourKeysAreAbsentToo )
{
  IVideoAttributes Attributes;
  Attributes.Set( "Saturation", "the caller's" );
  const IVideoAttributes Default = WriteEmpty( {}, { ITimecodeStandard::ETimecode25, 1, 2, 3, 4 }, Attributes );
  std::string Kept;
  EXPECT_TRUE( Default.Get( "Saturation", Kept ) );
  EXPECT_FALSE( Default.Has( "TicksPerSecond" ) );
  EXPECT_EQ( Default.Values().size(), 10u );   // the caller's and nine of the timecode

  const IVideoAttributes Timed = WriteEmpty( { 135000000, 5400000, 0 }, {}, Attributes );
  float Saturation = 0;
  EXPECT_TRUE( Timed.Get( "Saturation", Saturation ) );
  EXPECT_EQ( Saturation, 0.5f );
  EXPECT_EQ( Timed.Values().size(), 5u );
  EXPECT_TRUE( Timed.Has( "StartOffsetInTicks" ) );
}

TEST_F( TarvoWriter, OnlyAValidTimecodeIsStored )
{
  const auto Stores = [&]( const ITimecode& i_rTimecode ) { return WriteEmpty( {}, i_rTimecode, {} ).Has( "Timecode.Standards" ); };
  EXPECT_FALSE( Stores( { ITimecodeStandard::ETimecode25, 0, 0, 0, 25 } ) );
  EXPECT_FALSE( Stores( { ITimecodeStandard::ETimecode30Drop, 0, 1, 0, 1 } ) );
  EXPECT_TRUE( Stores( { ITimecodeStandard::ETimecode30Drop, 0, 1, 0, 2 } ) );
  EXPECT_TRUE( Stores( { ITimecodeStandard::ETimecode30Drop, 0, 10, 0, 0 } ) );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( TarvoWriter, AHeaderThatCannotBeEncodedSpoilsTheFile )
{
  VWriter& rWriter = m_File.m_Writer;
  ASSERT_TRUE( rWriter.Open( "memory" ) );
  EXPECT_FALSE( rWriter.WriteHeader( VideoInfo(), { IAudioSampleFormat::EInt16, 48000, 0 }, {}, {}, {}, {}, IVideoPayload::EUncompressed,
    IAudioPayload::EUncompressed ) );
  EXPECT_FALSE( m_File.m_Header.WriteTo( rWriter ) );
  EXPECT_FALSE( rWriter.Close() );
  EXPECT_EQ( m_Log.Texts(), ( std::vector<std::string>{ "Could not encode internal attributes.", "WriteHeader must be called once only." } ) );
}

TEST( TarvoWriterOfLargeFiles, PositionsBeyond4GiBAreIndexed )
{
  constexpr uint32_t Side = 32768;
  constexpr uint64_t FrameBytes = uint64_t{ Side } * Side;   // 1 GiB
  VHeader Header;
  Header.m_Video = VideoInfo( IPixelFormat::ELuminance8, Side, Side );
  Header.m_Audio = {};
  VSparseFile::VPieces Pieces;
  VWriter Writer( {}, [&]( const std::string& ) { return std::make_unique<VSparseFile>( Pieces ); } );
  ASSERT_TRUE( Writer.Open( "sparse" ) );
  ASSERT_TRUE( Header.WriteTo( Writer ) );
  const VBufferList Rows( Side, Buffer( VBytes( Side ) ) );
  for( uint64_t Key = 0; Key < 5; ++Key )
  {
    VBufferList Video = Rows;
    VBufferList Audio;
    ASSERT_TRUE( Writer.WriteFrame( Video, Header.m_Video, Audio, {}, Key ) );
  }
  ASSERT_TRUE( Writer.Close() );

  uint64_t IndexPosition = 0;
  std::memcpy( &IndexPosition, Pieces.at( 40 ).data(), sizeof( IndexPosition ) );
  EXPECT_EQ( Pieces.at( IndexPosition ), VLittleEndian().U64( 5 ).m_Bytes );
  VLittleEndian Entries;
  for( uint64_t Key = 0; Key < 5; ++Key )
  {
    Entries.U64( Key ).U64( IndexPosition - ( 5 - Key ) * FrameBytes );
  }
  EXPECT_EQ( Pieces.at( IndexPosition + 8 ), Entries.m_Bytes );
}
