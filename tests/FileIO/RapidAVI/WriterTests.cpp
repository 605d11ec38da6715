#include "tests/FileIO/RapidAVI/AviFile.h"
#include "tests/support/ByteBuilder.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace RapidAVI;
using namespace TestSupport;

namespace
{

// Two frames of 4 x 1 pixels, the first with one sample of sound and the second with none, up to the attributes.
VBytes ExpectedFile()
{
  VLittleEndian File;
  File.Raw( "RIFF" ).U32( 33626 ).Raw( "AVI " );
  File.Raw( "LIST" ).U32( 33416 ).Raw( "hdrl" );
  File.Raw( "avih" ).U32( 56 ).U32( 40000 ).U32( 200 ).U32( 0 ).U32( 0x810 );   // period, bytes a second, padding, flags
  File.U32( 2 ).U32( 0 ).U32( 2 ).U32( 0 ).U32( 4 ).U32( 1 ).Zeros( 16 );       // frames, initial, streams, buffer, width, height

  File.Raw( "LIST" ).U32( 16532 ).Raw( "strl" );
  File.Raw( "strh" ).U32( 56 ).Raw( "vidsUYVY" ).U32( 0 ).U32( 0 ).U32( 0 );       // flags, priority and language, initial
  File.U32( 1 ).U32( 25 ).U32( 0 ).U32( 2 ).U32( 8 ).U32( 0xFFFFFFFF ).U32( 0 );   // scale, rate, start, length, buffer, quality, sample
  File.U16( 0 ).U16( 0 ).U16( 4 ).U16( 1 );                                        // left, top, right, bottom
  File.Raw( "strf" ).U32( 40 ).U32( 40 ).U32( 4 ).U32( 1 ).U16( 1 ).U16( 16 );     // size, width, height, planes, bits
  File.Raw( "UYVY" ).U32( 8 ).Zeros( 16 );                                         // compression, image size
  File.Raw( "indx" ).U32( 0x4018 ).U16( 4 ).U16( 0 ).U32( 1 ).Raw( "00db" ).Zeros( 12 );
  File.U64( 33490 ).U32( 48 ).U32( 2 ).Zeros( 0x4000 - 16 );   // position, size and entries of ix00

  File.Raw( "LIST" ).U32( 16532 ).Raw( "strl" );
  File.Raw( "strh" ).U32( 56 ).Raw( "auds" ).U32( 1 ).U32( 0 ).U32( 0 ).U32( 0 );   // handler, flags, priority and language, initial
  File.U32( 1 ).U32( 48000 ).U32( 0 ).U32( 1 ).U32( 0x1000 );                       // scale, rate, start, length, buffer
  File.U32( 0xFFFFFFFF ).U32( 2 ).Zeros( 8 );                                       // quality, sample
  File.Raw( "strf" ).U32( 40 ).U16( 0xFFFE ).U16( 1 ).U32( 48000 ).U32( 96000 );    // tag, channels, rate, bytes a second
  File.U16( 2 ).U16( 16 ).U16( 22 ).U16( 16 ).U32( 4 );                             // block, bits, extension, valid bits, mask
  File.Raw( std::string( "\x01\0\0\0\0\0\x10\0\x80\0\0\xAA\0\x38\x9B\x71", 16 ) );
  File.Raw( "indx" ).U32( 0x4018 ).U16( 4 ).U16( 0 ).U32( 1 ).Raw( "01wb" ).Zeros( 12 );
  File.U64( 33538 ).U32( 40 ).U32( 1 ).Zeros( 0x4000 - 16 );

  File.Raw( "LIST" ).U32( 260 ).Raw( "odml" ).Raw( "dmlh" ).U32( 248 ).U32( 2 ).Zeros( 244 );
  File.Raw( "LIST" ).U32( 134 ).Raw( "movi" );
  EXPECT_EQ( File.m_Bytes.size(), 33448u );   // the base
  File.Raw( "00db" ).U32( 8 ).Raw( "ABCDEFGH" );
  File.Raw( "01wb" ).U32( 2 ).Raw( "ab" );
  File.Raw( "00db" ).U32( 8 ).Raw( "IJKLMNOP" );
  File.Raw( "ix00" ).U32( 40 ).U16( 2 ).U16( 0x100 ).U32( 2 ).Raw( "00db" ).U64( 33448 ).U32( 0 );
  File.U32( 8 ).U32( 8 ).U32( 34 ).U32( 8 );   // offset and size of each
  File.Raw( "ix01" ).U32( 32 ).U16( 2 ).U16( 0x100 ).U32( 1 ).Raw( "01wb" ).U64( 33448 ).U32( 0 );
  File.U32( 24 ).U32( 2 );
  File.Raw( "idx1" ).U32( 48 );
  File.Raw( "00db" ).U32( 0x10 ).U32( 4 ).U32( 8 );   // flags, offset, size
  File.Raw( "01wb" ).U32( 0x10 ).U32( 20 ).U32( 2 );
  File.Raw( "00db" ).U32( 0x10 ).U32( 30 ).U32( 8 );
  EXPECT_EQ( File.m_Bytes.size(), 33634u );
  return File.m_Bytes;
}

// An encoder that compresses every image to the same bytes.
std::shared_ptr<VideoEncoding::VVideoFrameEncoder> EncoderTo( const VBytes& i_rImage )
{
  VideoEncoding::VEncoderParts Parts;
  Parts.m_Compressors[IVideoPayload::EImageJPEG] =
    [i_rImage]( const VideoEncoding::VCompressionInput&, UtilsMemory::VByteVector& o_rOutput, UtilsMemory::VByteVector& )
  {
    o_rOutput.assign( i_rImage.begin(), i_rImage.end() );
    return true;
  };
  return std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software, Parts );
}

// SOI, APP0, so many segments of two bytes, SOS with its data and EOI.
VBytes Image( size_t i_Tables, const std::string& i_rData )
{
  std::string Text( "\xFF\xD8\xFF\xE0\0\x10JFIF\0\1\1\0\0\1\0\1\0\0", 20 );
  for( size_t Table = 0; Table < i_Tables; ++Table )
  {
    Text += std::string( "\xFF\xDB\0\4", 4 ) + "t" + static_cast<char>( '0' + Table );
  }
  return Bytes( Text + std::string( "\xFF\xDA\0\4s!", 6 ) + i_rData + "\xFF\xD9" );
}

class AviWriter : public testing::Test
{
protected:
  const VLogCapture m_Log{ "RapidAVI" };
};

}

TEST_F( AviWriter, ASmallFileIsTheseBytes )
{
  VAviFile File;
  ASSERT_TRUE( File.Begin() );
  ASSERT_TRUE( File.Frame( Bytes( "ABCDEFGH" ), Bytes( "ab" ), 0 ) );
  VBufferList Video{ Buffer( Bytes( "IJK" ) ), Buffer( {} ), Buffer( Bytes( "LMNOP" ) ) };
  VBufferList Audio;
  ASSERT_TRUE( File.m_Writer.WriteFrame( Video, File.m_Header.m_Video, Audio, MonoAudio, AppendKey ) );
  ASSERT_TRUE( File.m_Writer.Close() );
  const VBytes Expected = ExpectedFile();
  EXPECT_EQ( VBytes( File.m_pBytes->begin(), File.m_pBytes->begin() + static_cast<std::ptrdiff_t>( Expected.size() ) ), Expected );
  EXPECT_EQ( File.Parse().Riff().Riffs().size(), 2u );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( AviWriter, ARiffTakesFramesUntilItHasReachedItsLimit )
{
  // 8 bytes of image and 2 of sound count 24 and 18: the fourth image reaches 4 x 24 + 3 x 18 = 150 exactly.
  VAviFile File( VSettings(), { 150, 60 } );
  ASSERT_TRUE( File.Begin() );
  for( uint32_t Frame = 0; Frame < 9; ++Frame )
  {
    ASSERT_TRUE( File.Frame( Noise( 8, Frame ), Noise( 2, Frame ), Frame ) );
  }
  ASSERT_TRUE( File.m_Writer.Close() );

  const VAviParser Parser = File.Parse();
  std::vector<std::string> Layout;
  for( const VRiffChunk& rRiff : Parser.Riff().Riffs() )
  {
    std::string Text = rRiff.m_Form + ":";
    for( const VRiffChunk& rChunk : rRiff.Count( "movi" ) == 0 ? rRiff.m_Children : rRiff.Child( "movi" ).m_Children )
    {
      Text += " " + rChunk.m_Id;
    }
    Layout.push_back( Text );
  }
  // The sound of a frame that ends a RIFF begins the next one.
  EXPECT_EQ( Layout,
    ( std::vector<std::string>{ "AVI : 00db 01wb 00db 01wb 00db 01wb 00db ix00 ix01", "AVIX: 01wb 00db 01wb 00db ix00 ix01",
      "AVIX: 01wb 00db 01wb 00db ix00 ix01", "AVIX: 01wb 00db 01wb ix00 ix01", "TMSL:" } ) );
  for( const size_t Stream : { 0u, 1u } )
  {
    EXPECT_EQ( Parser.StreamLength( Stream ), 9u );
    EXPECT_EQ( Parser.CountIndexed( Stream ), 9u );
  }
}

TEST_F( AviWriter, ASuperIndexHoldsTheFirst1024Riffs )
{
  VAviFile File( VSettings(), { 1, 1 } );
  ASSERT_TRUE( File.Begin() );
  for( uint32_t Frame = 0; Frame < 1030; ++Frame )
  {
    ASSERT_TRUE( File.Frame( Noise( 8, Frame ), {}, Frame ) );
  }
  ASSERT_TRUE( File.m_Writer.Close() );
  const VAviParser Parser = File.Parse();
  // The last one has the sound of the last frame alone.
  EXPECT_EQ( Parser.Riff().Riffs().size(), 1030u + 1 + 1 );
  EXPECT_EQ( Parser.SuperIndexEntries( 0 ), 1024u );
  EXPECT_EQ( Parser.CountIndexed( 0 ), 1024u );
  EXPECT_EQ( Parser.TotalFrames(), 1030u );
  EXPECT_EQ( Parser.Chunks( 0 ).size(), 1030u );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( AviWriter, JPEGImagesGetAnAVI1Header )
{
  // What lies in the file of an image; nothing of one that is refused.
  const auto Store = []( const VBytes& i_rImage, IPixelFormat::Enum i_Format = IPixelFormat::ER8G8B8 )
  {
    VSettings Settings( VideoInfo( i_Format, 2, 1 ) );
    Settings.m_Payload = IVideoPayload::EImageJPEG;
    Settings.m_Audio = {};
    VAviFile File( Settings, {}, EncoderTo( i_rImage ) );
    EXPECT_TRUE( File.Begin() );
    const bool bWritten = File.Frame( Noise( 6, 0 ), {}, 0 );
    EXPECT_TRUE( File.m_Writer.Close() );
    return bWritten ? File.Parse().Riff().Content( File.Parse().Chunks( 0 ).at( 0 ) ) : VBytes();
  };
  const auto WithAVI1Header = []( VBytes i_Image )
  {
    const VBytes Header = VLittleEndian().Raw( "\xFF\xD8\xFF\xE0" ).U8( 0 ).U8( 16 ).Raw( "AVI1" ).Zeros( 10 ).m_Bytes;
    std::copy( Header.begin(), Header.end(), i_Image.begin() );
    return i_Image;
  };
  EXPECT_EQ( Store( Image( 7, "data" ) ), WithAVI1Header( Image( 7, "data" ) ) );
  EXPECT_EQ( Store( Image( 7, "datum" ) ), WithAVI1Header( Image( 7, "datum" ) ) ) << "of an odd size";
  EXPECT_EQ( Store( Image( 4, "data" ), IPixelFormat::ELuminance8 ), WithAVI1Header( Image( 4, "data" ) ) );
  EXPECT_TRUE( m_Log.Texts().empty() );
  EXPECT_EQ( Store( Image( 6, "data" ) ), VBytes() );
  EXPECT_EQ( Store( Image( 8, "data" ) ), VBytes() );
  EXPECT_EQ( Store( Image( 4, "data" ) ), VBytes() );
  EXPECT_EQ( Store( Image( 7, "data" ), IPixelFormat::ELuminance8 ), VBytes() );
  EXPECT_EQ( m_Log.Count( "Generate JPEG not in expected format." ), 4u );
  EXPECT_EQ( Store( Bytes( "no image" ) ), VBytes() );
}

TEST_F( AviWriter, RefusalsSayWhy )
{
  VAviFile File;
  ASSERT_TRUE( File.Begin() );
  EXPECT_FALSE( File.Frame( VBytes( 8 ), {}, 1 ) );
  EXPECT_FALSE( File.Frame( VBytes( 7 ), {}, 0 ) );
  EXPECT_FALSE( VSettings( VideoInfo( IPixelFormat::EU8Y8V8Y8, 2, 2 ) ).WriteFrame( File.m_Writer, VBytes( 8 ) ) );
  EXPECT_FALSE( VSettings( VideoInfo( IPixelFormat::ELuminance8 ) ).WriteFrame( File.m_Writer, VBytes( 4 ) ) );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Frame 1 cannot be stored where frame 0 comes next.", "Frame 0 of 7 bytes does not fit the file's 8.",
      "A frame of 2 x 2 pixels does not fit the file's 4 x 1.", "Encoding to 'Uncompressed' failed." } ) );
}

TEST_F( AviWriter, WithoutARateOrASampleFormatThereIsAWarning )
{
  const VLogCapture Log( "AVIIO" );
  VAviFile File;
  File.m_Header.m_Timing = {};
  File.m_Header.m_Audio = {};
  File.m_Header.m_AudioPayload = IAudioPayload::EUncompressed;
  ASSERT_TRUE( File.Begin() );
  EXPECT_TRUE( File.Frame( Noise( 8, 0 ), Noise( 2, 0 ), 0 ) );
  ASSERT_TRUE( File.m_Writer.Close() );
  EXPECT_EQ( File.Parse().Headers().Count( "strl" ), 1u );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "Unsupported audio payload when writing AVI file." } );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "The frame rate is not known: readers will take one of their own." } );
}
