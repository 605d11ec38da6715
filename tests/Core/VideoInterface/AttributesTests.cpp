#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/VideoAttributes.h"

#include <gtest/gtest.h>

using namespace KVZ;

namespace
{

VideoFrameInfo WholeVideo()
{
  VideoFrameInfo Info;
  Info.m_ImageX = 1;
  Info.m_ImageY = 2;
  Info.m_ImageWidth = 1920;
  Info.m_ImageHeight = 1080;
  Info.m_PixelFormat = IPixelFormat::EU8Y8V8Y8;
  Info.m_bInverted = true;
  Info.m_PixelAspectRatio = 1.5;
  Info.m_InterlacedFormat = IInterlacedFormat::EInterlacedFrameOddOlder;
  return Info;
}

// What one record writes, another one reads back as the same.
template<class TRecord>
void CheckRoundTrip( const TRecord& i_rRecord )
{
  IVideoAttributes Attributes;
  ASSERT_TRUE( i_rRecord.WriteAttributes( Attributes, "Camera 1." ) );
  TRecord Back;
  EXPECT_TRUE( Back.ReadAttributes( Attributes, "Camera 1." ) );
  EXPECT_EQ( Back, i_rRecord );
}

}

TEST( FrameRecords, ComeBackAsTheyWere )
{
  CheckRoundTrip( WholeVideo() );
  CheckRoundTrip( AudioFrameInfo{ IAudioSampleFormat::EInt24, 48000, 16 } );
  CheckRoundTrip( VTimingRecord{ 1000, 40, -5 } );
  CheckRoundTrip( VColourRecord{ 0.5f, 2.2f } );
  CheckRoundTrip( VCameraHardwareRecord{ "vi:0", "Type", "Display", 640, 480, 1.25 } );
  CheckRoundTrip( VLensDistortionRecord{ VLensDistortionRecord::ETarvo3Parameter, { 0.5, 0.25 }, { 1.0, 2.0, 3.0 } } );

  const std::vector<VConversionRecord> Steps{ { "MOV", "None", "ImageJPEG", "R8G8B8" }, { "TVID", "Uncompressed", "Uncompressed", "U8Y8V8Y8" } };
  IVideoAttributes Attributes;
  WriteAttributes( Steps, Attributes );
  std::vector<VConversionRecord> Back;
  EXPECT_TRUE( ReadAttributes( Back, Attributes ) );
  EXPECT_EQ( Back, Steps );
  EXPECT_TRUE( Attributes.Has( "ConversionRecord.1.VideoFrameInfo.PixelFormat" ) );

  ITimecode Timecode{ ITimecodeStandard::ETimecode30Drop, 1, 2, 3, 4, 0x12345678, -2, 9, 2252250 };
  WriteAttributes( Timecode, Attributes );
  ITimecode TimecodeBack;
  EXPECT_TRUE( ReadAttributes( TimecodeBack, Attributes ) );
  EXPECT_TRUE( IsSameReading( TimecodeBack, Timecode ) );
  EXPECT_EQ( TimecodeBack.m_SubFramePeriod, 2252250u );
}

TEST( FrameRecords, AnEmptyDescriptionIsOneKeyAndAHalfOneIsNone )
{
  IVideoAttributes Attributes;
  EXPECT_TRUE( VideoFrameInfo().WriteAttributes( Attributes ) );
  EXPECT_TRUE( AudioFrameInfo().WriteAttributes( Attributes ) );
  EXPECT_EQ( Attributes.Values().size(), 2u );

  IVideoAttributes None;
  VideoFrameInfo Video = WholeVideo();
  Video.m_ImageHeight = 0;
  EXPECT_FALSE( Video.WriteAttributes( None ) );
  EXPECT_FALSE( ( AudioFrameInfo{ IAudioSampleFormat::EInt16, 48000, 0 } ).WriteAttributes( None ) );
  VideoFrameInfo AspectAlone;
  AspectAlone.m_PixelAspectNumerator = 4;
  EXPECT_FALSE( AspectAlone.WriteAttributes( None ) );
  EXPECT_TRUE( None.Values().empty() );
}

TEST( FrameRecords, ReadingNeedsEveryKeyInItsType )
{
  IVideoAttributes Attributes;
  VideoFrameInfo Video = WholeVideo();
  EXPECT_TRUE( Video.ReadAttributes( Attributes ) );
  EXPECT_TRUE( Video.IsEmpty() );

  WholeVideo().WriteAttributes( Attributes );
  Attributes.Set( "VideoFrameInfo.ImageHeight", int32_t{ 1080 } );
  EXPECT_FALSE( Video.ReadAttributes( Attributes ) );
  EXPECT_EQ( Video.m_ImageWidth, 1920u );
  EXPECT_EQ( Video.m_ImageHeight, 0u );

  Attributes.Set( "VideoFrameInfo.ImageHeight", uint32_t{ 1080 } );
  Attributes.Set( "VideoFrameInfo.PixelFormat", "NoSuchFormat" );
  EXPECT_FALSE( Video.ReadAttributes( Attributes ) );
}
