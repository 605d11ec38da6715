// PNG and TIFF, written by us and read by us and by others.
#include "FileIO/PNGIO/PNGIO.h"
#include "FileIO/TIFFIO/TIFFIO.h"
#include "tests/support/LogCapture.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/Threads.h"

#include <gtest/gtest.h>

#include <atomic>
#include <fstream>
#include <random>

using KVZ::IPixelFormat;
using UtilsMemory::VByteVector;

namespace
{

struct VKind
{
  const char* m_pName;
  const char* m_pCategory;
  const char* m_pIdentity;   // of a 61 by 37 image, as ImageMagick's program tells it
  decltype( &PNGIO::PNGWriter ) m_pWriter;
  decltype( &PNGIO::PNGReader ) m_pReader;
};

constexpr VKind Kinds[] = { { "png", "PNGIO", "PNG 61 37 8 ", &PNGIO::PNGWriter, &PNGIO::PNGReader },
  { "tiff", "TIFFIO", "TIFF 61 37 8 ", &TIFFIO::TIFFWriter, &TIFFIO::TIFFReader } };

const ImageMagickWrapper::VLibrary& Library() { return ImageMagickWrapper::Instance( PNGIO::Category ); }

struct VImage
{
  KVZ::VideoFrameInfo m_Info;
  VByteVector m_Pixels;
};

// Holds every value of a channel.
VImage MakeImage( IPixelFormat::Enum i_Format, uint32_t i_Width, uint32_t i_Height, uint32_t i_Seed = 1 )
{
  VImage Image{ { .m_ImageWidth = i_Width, .m_ImageHeight = i_Height, .m_PixelFormat = i_Format },
    VByteVector( KVZ::GetImageSize( i_Format, i_Width, i_Height ) ) };
  std::mt19937 Random( i_Seed );
  for( size_t Index = 0; Index < Image.m_Pixels.size(); ++Index )
  {
    Image.m_Pixels[Index] = static_cast<uint8_t>( Index < 256 ? Index : Random() );
  }
  return Image;
}

bool Write( const VKind& i_rKind, const VImage& i_rImage, VByteVector& o_rFile )
{
  return i_rKind.m_pWriter( i_rImage.m_Pixels.data(), i_rImage.m_Pixels.size(), i_rImage.m_Info, o_rFile, Library() );
}

bool Read( const VKind& i_rKind, const VByteVector& i_rFile, VImage& o_rImage )
{
  return i_rKind.m_pReader( i_rFile.data(), i_rFile.size(), o_rImage.m_Info, o_rImage.m_Pixels, Library() );
}

bool ComesBack( const VKind& i_rKind, const VImage& i_rImage )
{
  VByteVector File;
  VImage Read;
  return Write( i_rKind, i_rImage, File ) && ::Read( i_rKind, File, Read ) && Read.m_Info == i_rImage.m_Info && Read.m_Pixels == i_rImage.m_Pixels;
}

// What another program writes to its standard output
std::string OutputOf( const std::vector<std::string>& i_rCommand )
{
  const TestSupport::VRunResult Result = TestSupport::RunProgram( i_rCommand );
  EXPECT_EQ( Result.m_ExitCode, 0 ) << Result.m_Error;
  return Result.m_Output;
}

// Ten by ten pixels: the first colour on the left, the second on the right.
VByteVector MakeForeignFile( const VKind& i_rKind, const std::string& i_rType, const std::string& i_rLeft, const std::string& i_rRight )
{
  const std::string File = OutputOf(
    { "convert", "-size", "5x10", "xc:" + i_rLeft, "xc:" + i_rRight, "+append", "-type", i_rType, i_rKind.m_pName + std::string( ":-" ) } );
  return { File.begin(), File.end() };
}

}

TEST( ImageFiles, ComeBackBitExactFromOurReaderAndOthers )
{
  const TestSupport::VTemporaryFolder Folder;
  for( const VKind& rKind : Kinds )
  {
    for( const IPixelFormat::Enum Format : { IPixelFormat::ELuminance8, IPixelFormat::ER8G8B8 } )
    {
      SCOPED_TRACE( rKind.m_pName + KVZ::ToName( Format ) );
      const bool bGrey = Format == IPixelFormat::ELuminance8;
      const VImage Image = MakeImage( Format, 61, 37 );
      EXPECT_TRUE( ComesBack( rKind, Image ) );

      VByteVector File;
      ASSERT_TRUE( Write( rKind, Image, File ) );
      const std::string Path = Folder.File( "image." + std::string( rKind.m_pName ) );
      std::ofstream( Path, std::ios::binary ).write( reinterpret_cast<const char*>( File.data() ), static_cast<std::streamsize>( File.size() ) );
      const std::string Pixels( Image.m_Pixels.begin(), Image.m_Pixels.end() );
      EXPECT_TRUE(
        OutputOf( { "ffmpeg", "-nostdin", "-v", "error", "-i", Path, "-f", "rawvideo", "-pix_fmt", bGrey ? "gray" : "rgb24", "-" } ) == Pixels );
      EXPECT_TRUE( OutputOf( { "convert", Path, "-depth", "8", bGrey ? "gray:-" : "rgb:-" } ) == Pixels );
      EXPECT_EQ( OutputOf( { "identify", "-format", "%m %w %h %z %[type]", Path } ),
        rKind.m_pIdentity + std::string( bGrey ? "Grayscale" : "TrueColor" ) );
    }
  }
}

TEST( ImageFiles, OfFewColoursComeBackInColour )
{
  for( const VKind& rKind : Kinds )
  {
    VImage Image;
    ASSERT_TRUE( Read( rKind, MakeForeignFile( rKind, "Palette", "#FF000A", "#145AC8" ), Image ) );
    EXPECT_EQ( Image.m_Info.m_PixelFormat, IPixelFormat::ER8G8B8 );
    EXPECT_EQ( Image.m_Info.m_ImageHeight, 10u );
    ASSERT_EQ( Image.m_Pixels.size(), 300u );
    const VByteVector Middle( Image.m_Pixels.begin() + 30 * 5 + 12, Image.m_Pixels.begin() + 30 * 5 + 18 );
    EXPECT_EQ( Middle, ( VByteVector{ 0xFF, 0x00, 0x0A, 0x14, 0x5A, 0xC8 } ) );
  }
}

TEST( ImageFiles, RefusalsSayWhy )
{
  for( const VKind& rKind : Kinds )
  {
    const TestSupport::VLogCapture Log( rKind.m_pCategory );
    const VByteVector Kept{ 1, 2, 3 };
    VByteVector File = Kept;
    // What the library is not asked about: formats, short buffers, and sides that would end the process
    const VImage Whole = MakeImage( IPixelFormat::ER8G8B8, 4, 4 );
    EXPECT_FALSE( Write( rKind, MakeImage( IPixelFormat::EB8G8R8, 4, 4 ), File ) );
    VImage Short = Whole;
    Short.m_Pixels.pop_back();
    EXPECT_FALSE( Write( rKind, Short, File ) );
    for( const uint32_t Side : { 0u, 17000u } )
    {
      VImage Odd = MakeImage( IPixelFormat::ELuminance8, 17000, 1 );
      Odd.m_Info.m_ImageWidth = Side;
      EXPECT_FALSE( Write( rKind, Odd, File ) );
    }
    EXPECT_TRUE( Log.Texts().empty() );
    // What it does not like
    const ImageMagickWrapper::VFileKind NoKind{ "nosuchformat", rKind.m_pCategory };
    EXPECT_FALSE( ImageMagickWrapper::EncodeImage( Library(), NoKind, Whole.m_Pixels.data(), Whole.m_Pixels.size(), Whole.m_Info, File ) );
    EXPECT_EQ( File, Kept );
    VImage Image;
    EXPECT_FALSE( Read( rKind, Kept, Image ) );
    EXPECT_FALSE( Read( rKind, MakeForeignFile( rKind, "TrueColorMatte", "#FF000A80", "#145AC840" ), Image ) );
    EXPECT_TRUE( Image.m_Info.IsEmpty() );
    const std::vector<std::string> Texts = Log.Texts();
    ASSERT_EQ( Texts.size(), 3u );
    EXPECT_EQ( Texts[0].find( "ImageMagick exception: " ), 0u );
    EXPECT_EQ( Texts[1].find( "ImageMagick exception: no decode delegate for this image format" ), 0u );
    EXPECT_EQ( Texts[2], "Unsupported format" );
  }
}

TEST( ImageFiles, SeveralThreadsAtOnce )
{
  std::atomic<int> Good{ 0 };
  TestSupport::RunOnThreads( 4,
    [&]( uint32_t i_Thread )
    {
      for( uint32_t Round = 0; Round < 6; ++Round )
      {
        const IPixelFormat::Enum Format = Round % 2 ? IPixelFormat::ER8G8B8 : IPixelFormat::ELuminance8;
        Good += ComesBack( Kinds[( i_Thread + Round / 2 ) % 2], MakeImage( Format, 64 + i_Thread, 48, i_Thread * 10 + Round ) );
      }
    } );
  EXPECT_EQ( Good, 24 );
}
