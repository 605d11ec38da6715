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

TEST( MkvTracks, VideoIsDescribed )
{
  VDescription Description;
  Description.m_Video = VideoInfo( IPixelFormat::EU8Y8V8Y8, 720, 486 );
  const VEbmlParser File = HeaderOf( Description );
  EXPECT_EQ( File.Number( InTrack( { Ebml::TrackNumber } ) ), 1u );
  EXPECT_NE( File.Number( InTrack( { Ebml::TrackUID } ) ), 0u );
  EXPECT_EQ( File.Number( InTrack( { Ebml::TrackType } ) ), 1u );
  EXPECT_EQ( File.Number( InTrack( { Ebml::FlagLacing } ) ), 0u );
  EXPECT_EQ( File.Number( InTrack( { Ebml::DefaultDuration } ) ), 33366666u );
  EXPECT_EQ( File.Number( InTrack( { Ebml::Video, Ebml::PixelWidth } ) ), 720u );
  EXPECT_EQ( File.Number( InTrack( { Ebml::Video, Ebml::PixelHeight } ) ), 486u );
  EXPECT_EQ( File.Number( InTrack( { Ebml::Video, Ebml::DisplayWidth } ) ), 720u );
  EXPECT_EQ( File.Number( InTrack( { Ebml::Video, Ebml::DisplayHeight } ) ), 486u );
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

TEST( MkvTracks, EverySampleFormatHasItsCodec )
{
  struct VCase
  {
    IAudioSampleFormat::Enum m_Format;
    const char* m_pCodec;
    uint64_t m_Bits;
  };
  for( const VCase& rCase : { VCase{ IAudioSampleFormat::EInt16, "A_PCM/INT/LIT", 16 }, VCase{ IAudioSampleFormat::EInt24, "A_PCM/INT/LIT", 24 },
         VCase{ IAudioSampleFormat::EInt32, "A_PCM/INT/LIT", 32 }, VCase{ IAudioSampleFormat::EFloat32, "A_PCM/FLOAT/IEEE", 32 } } )
  {
    SCOPED_TRACE( ToName( rCase.m_Format ) );
    VDescription Description;
    Description.m_Audio = { rCase.m_Format, 44100, 16 };
    const VEbmlParser File = HeaderOf( Description );
    const VEbmlElement* pTrack = File.FindAll( { Ebml::Segment, Ebml::Tracks, Ebml::TrackEntry } ).at( 1 );
    const auto Find = [&]( const VEbmlParser::VPath& i_rPath ) -> const VEbmlElement&
    { return *VEbmlParser::FindIn( pTrack->m_Children, i_rPath ).at( 0 ); };
    EXPECT_EQ( File.TextOf( Find( { Ebml::CodecID } ) ), rCase.m_pCodec );
    EXPECT_EQ( File.TextOf( Find( { Ebml::Language } ) ), "eng" );
    const std::map<uint32_t, uint64_t> Numbers = { { Ebml::TrackNumber, 2 }, { Ebml::TrackType, 2 }, { Ebml::FlagEnabled, 1 },
      { Ebml::FlagDefault, 1 }, { Ebml::FlagForced, 1 }, { Ebml::FlagLacing, 0 }, { Ebml::MinCache, 100000 }, { Ebml::MaxBlockAdditionID, 0 } };
    for( const auto& [Id, Value] : Numbers )
    {
      EXPECT_EQ( File.NumberOf( Find( { Id } ) ), Value ) << std::hex << Id;
    }
    EXPECT_EQ( File.NumberOf( Find( { Ebml::Audio, Ebml::Channels } ) ), 16u );
    EXPECT_EQ( File.NumberOf( Find( { Ebml::Audio, Ebml::BitDepth } ) ), rCase.m_Bits );
    EXPECT_EQ( File.Real( { Ebml::Segment, Ebml::Tracks, Ebml::TrackEntry, Ebml::Audio, Ebml::SamplingFrequency } ), 44100.0 );
    EXPECT_EQ( File.Real( { Ebml::Segment, Ebml::Tracks, Ebml::TrackEntry, Ebml::Audio, Ebml::OutputSamplingFrequency } ), 44100.0 );
  }
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
