// What the tracks say of pictures and sound.
#include "FileIO/MkvIO/ElementSetting.h"
#include "FileIO/MkvIO/Tracks.h"
#include "tests/FileIO/MkvIO/SmallMovie.h"
#include "tests/support/EbmlParser.h"

#include <ebml/MemIOCallback.h>
#include <gtest/gtest.h>

using namespace KVZ;
using namespace MkvIO;
using namespace TestSupport;

namespace
{

VEbmlParser HeaderOf( const VDescription& i_rDescription )
{
  VSmallMovie Movie( i_rDescription );
  EXPECT_TRUE( Movie.Begin() );
  return VEbmlParser( *Movie.m_pBytes );
}

VEbmlParser::VPath InTrack( std::initializer_list<uint32_t> i_Ids )
{
  VEbmlParser::VPath Path = { Ebml::Segment, Ebml::Tracks, Ebml::TrackEntry };
  Path.insert( Path.end(), i_Ids );
  return Path;
}

}

TEST( MkvTracks, EveryPixelFormatHasItsBitmapHeader )
{
  const std::map<IPixelFormat::Enum, std::string> FourCCs = { { IPixelFormat::ELuminance8, "GREY" }, { IPixelFormat::EBayerGB8, "GREY" },
    { IPixelFormat::ER8G8B8u8, "RGBA" }, { IPixelFormat::EU8Y8V8Y8, "UYVY" }, { IPixelFormat::EY8U8Y8V8, "YUY2" } };
  for( const auto& [Format, FourCC] : FourCCs )
  {
    SCOPED_TRACE( ToName( Format ) );
    VDescription Description;
    Description.m_Video = VideoInfo( Format, 0x0102, 0x0304 );
    const VEbmlParser File = HeaderOf( Description );
    EXPECT_EQ( File.Text( InTrack( { Ebml::CodecID } ) ), "V_MS/VFW/FOURCC" );
    const std::vector<uint8_t> Header = {
      40, 0, 0, 0,              // size
      2, 1, 0, 0, 4, 3, 0, 0,   // width, height
      1, 0, 0, 0,               // planes, bit count
      static_cast<uint8_t>( FourCC[0] ), static_cast<uint8_t>( FourCC[1] ), static_cast<uint8_t>( FourCC[2] ), static_cast<uint8_t>( FourCC[3] ), 0,
      0, 0, 0,                                         // image size
      0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0   // rest
    };
    EXPECT_EQ( File.BytesOf( File.Find( InTrack( { Ebml::CodecPrivate } ) ) ), Header );
  }
}

TEST( MkvTracks, AJPEGTrackHasNoPrivateData )
{
  VDescription Description;
  Description.m_Payload = IVideoPayload::EImageJPEG;
  Description.m_Video = VideoInfo( IPixelFormat::EU10Y10V10Y10, 48, 2 );
  const VEbmlParser File = HeaderOf( Description );
  EXPECT_EQ( File.Text( InTrack( { Ebml::CodecID } ) ), "V_MJPEG" );
  EXPECT_TRUE( File.FindAll( InTrack( { Ebml::CodecPrivate } ) ).empty() );
  EXPECT_EQ( ReadTags( File ).at( "Tarvo.Internal.VideoFrameInfo.PixelFormat" ), "R8G8B8" ) << "the format that is compressed";
}

// A codec that no payload of ours selects so far.
TEST( MkvTracks, AColourSpaceStandsAmongThePicturesFields )
{
  libmatroska::KaxTracks Tracks;
  FillVideoTrack( Tracks, VideoInfo(), { "V_UNCOMPRESSED", EFourCCPlace::ColourSpace, "UYVY" }, 1 );
  libebml::MemIOCallback Memory;
  Tracks.Render( Memory );
  const VEbmlParser File( { Memory.GetDataBuffer(), Memory.GetDataBuffer() + Memory.GetDataBufferSize() } );
  EXPECT_EQ( File.Text( { Ebml::Tracks, Ebml::TrackEntry, Ebml::CodecID } ), "V_UNCOMPRESSED" );
  EXPECT_EQ( File.Text( { Ebml::Tracks, Ebml::TrackEntry, Ebml::Video, Ebml::UncompressedFourCC } ), "UYVY" );
  EXPECT_TRUE( File.FindAll( { Ebml::Tracks, Ebml::TrackEntry, Ebml::CodecPrivate } ).empty() );
}
