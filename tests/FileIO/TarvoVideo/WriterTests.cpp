#include "tests/support/LogCapture.h"
#include "tests/support/SmallTvidFile.h"

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
  // The external block of a file without frames.
  IVideoAttributes WriteEmpty( const VTimingRecord& i_rTiming, const ITimecode& i_rTimecode )
  {
    VHeader& rHeader = m_File.m_Header;
    rHeader.m_Timing = i_rTiming;
    rHeader.m_Timecode = i_rTimecode;
    rHeader.m_Colour = { 0.5f, 2.0f };
    rHeader.m_Attributes.Set( "Saturation", "the caller's" );
    EXPECT_TRUE( m_File.Begin() && m_File.m_Writer.Close() );
    VReader Reader;
    EXPECT_TRUE( Reader.Open( std::make_unique<ISimpleInputStreamAdapter>( *m_File.m_pBytes ), m_File.m_pBytes->size() ) ) << Reader.GetError();
    return Reader.GetExternalAttributes();
  }

  const VLogCapture m_Log{ "TarvoVideo" };
  VSmallFile m_File;
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

// Whichever operation fails: a reader finds the old frame, the new one or none.
TEST_F( TarvoWriter, AFrameThatCouldNotBeReplacedIsNeverHalfOfEach )
{
  const VFrameContent Old{ Bytes( "ABCD" ), Bytes( "abcd" ) };
  const VFrameContent New{ Bytes( "EFGH" ), Bytes( "efgh" ) };
  bool bClosed = false;
  for( uint64_t Operation = 0; !bClosed; ++Operation )
  {
    SCOPED_TRACE( Operation );
    VSmallFile File( { .m_Operation = Operation } );
    const bool bWritten = File.Begin() && File.WriteFrame( 0, New ) && File.WriteFrame( 1, Old ) && File.WriteFrame( 1, New );
    bClosed = File.m_Writer.Close();
    EXPECT_TRUE( bWritten || !bClosed );
    VFound Found = ReadAll( *File.m_pBytes );
    EXPECT_TRUE( !Found.m_bFinished || Found.m_Frames.count( 1 ) == 0 || Found.m_Frames[1] == Old || Found.m_Frames[1] == New );
  }
}

TEST_F( TarvoWriter, RefusalsSayWhy )
{
  ASSERT_TRUE( m_File.Begin() );
  EXPECT_FALSE( m_File.WriteFrame( 5, { Bytes( "ABC" ), {} } ) );
  VHeader Colour = m_File.m_Header;
  Colour.m_Video.m_PixelFormat = IPixelFormat::ER8G8B8;
  EXPECT_FALSE( Colour.WriteFrame( m_File.m_Writer, VBytes( 12 ), {}, 5 ) );

  VSmallFile WithoutChannels;
  WithoutChannels.m_Header.m_Audio.m_Channels = 0;
  EXPECT_FALSE( WithoutChannels.Begin() );
  EXPECT_FALSE( m_File.m_Header.WriteTo( WithoutChannels.m_Writer ) ) << "the file is spoilt";
  EXPECT_FALSE( WithoutChannels.m_Writer.Close() );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Frame 5 of 4 x 1 pixels and 3 bytes does not fit the file's 4 x 1 pixels and 4 bytes.",
      "Encoding to 'Uncompressed' failed.", "Could not encode internal attributes.", "WriteHeader must be called once only." } ) );
}

TEST_F( TarvoWriter, WithDefaultTimingTheColourKeysAreAbsentToo )
{
  const IVideoAttributes Default = WriteEmpty( {}, { ITimecodeStandard::ETimecode25, 1, 2, 3, 4 } );
  std::string Kept;
  EXPECT_TRUE( Default.Get( "Saturation", Kept ) );
  EXPECT_FALSE( Default.Has( "TicksPerSecond" ) );
  EXPECT_EQ( Default.Values().size(), 11u );   // the caller's two and nine of the timecode

  const IVideoAttributes Timed = WriteEmpty( Rate25, {} );
  float Saturation = 0;
  EXPECT_TRUE( Timed.Get( "Saturation", Saturation ) );
  EXPECT_EQ( Saturation, 0.5f );
  EXPECT_EQ( Timed.Values().size(), 6u );
}
