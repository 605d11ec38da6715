// Where recordings end that nobody can wait for.
#include "apps/stagehost/RecordLimits.h"

#include <gtest/gtest.h>

#include <cmath>

namespace
{

constexpr uint64_t Image1080 = 1920 * 1080 * 2;
constexpr uint32_t Period25 = 5400000;
constexpr uint32_t Period2997 = 4504500;
constexpr uint32_t Period5994 = 2252250;
constexpr KVZ::AudioFrameInfo Stereo{ KVZ::IAudioSampleFormat::EInt16, 48000, 2 };

double HoursOf( const VStoredFormat& i_rFormat ) { return FindRunLimit( i_rFormat ).m_Seconds / 3600.0; }

}

TEST( RecordLimits, AreThoseOfTheContainersFields )
{
  using KVZ::IVideoContainer;
  EXPECT_NEAR( HoursOf( { IVideoContainer::EMOV, Image1080, Period25, Stereo } ), 24.855, 0.001 );
  EXPECT_NEAR( HoursOf( { IVideoContainer::EMP4, Image1080, Period2997, Stereo } ), 4.971, 0.001 );
  EXPECT_NEAR( HoursOf( { IVideoContainer::EMOV, 0, Period5994, Stereo } ), 4.971, 0.001 ) << "compressed or not, time is the same";
  EXPECT_GT( HoursOf( { IVideoContainer::EMOV, Image1080, Period25, {} } ), 24 * 365 );
  EXPECT_NEAR( HoursOf( { IVideoContainer::EAVI, Image1080, Period25, Stereo } ), 5.740, 0.001 );
  EXPECT_NEAR( HoursOf( { IVideoContainer::EAVI, 4 * Image1080, Period5994, Stereo } ), 0.5993, 0.001 );
  EXPECT_NEAR( HoursOf( { IVideoContainer::EAVI, 0, Period25, Stereo } ), 24.855, 0.001 ) << "samples, where the images' size is not known";
  EXPECT_TRUE( FindRunLimit( { IVideoContainer::EAVI, Image1080, Period25, Stereo } ).m_bIndexAlone );
  EXPECT_FALSE( FindRunLimit( { IVideoContainer::EAVI, 0, Period25, Stereo } ).m_bIndexAlone );
  for( const auto Container : { IVideoContainer::ETVID, IVideoContainer::EMKV, IVideoContainer::EIMAGES } )
  {
    EXPECT_TRUE( std::isinf( HoursOf( { Container, Image1080, Period2997, Stereo } ) ) ) << Container;
  }
}

TEST( RecordLimits, AreToldAtTheStartWhereTheyAreNear )
{
  const VLimitNotice Near( "vi:0", { 5.72 * 3600, "the index of an AVI file", true } );
  EXPECT_EQ( Near.AtStart( 60.0 ), "vi:0: With these settings the index of an AVI file is full after 5.7 hours." );
  EXPECT_EQ( Near.AtStart( 86400.0 ),
    "vi:0: With these settings the index of an AVI file is full after 5.7 hours. The recording is to be longer. Players will not seek to frames "
    "that come later." );
  const VLimitNotice Far( "vi:1", { 25 * 3600.0, "a MOV file" } );
  EXPECT_EQ( Far.AtStart( 86400.0 ), "" );
  EXPECT_EQ( Far.AtStart( 90001.0 ),
    "vi:1: With these settings a MOV file is full after 25.0 hours. The recording is to be longer. No frame is stored that comes later." );
  EXPECT_EQ( VLimitNotice( "vi:2", {} ).AtStart( 1e9 ), "" );
}

TEST( RecordLimits, AreWarnedOfOnceBeforeTheyAreReached )
{
  VLimitNotice Long( "vi:0", { 5 * 3600.0, "a MOV file" } );
  EXPECT_EQ( Long.After( 5 * 3600.0 - 601.0 ), "" );
  EXPECT_EQ( Long.After( 5 * 3600.0 - 600.0 ), "vi:0: In 10 minutes a MOV file is full. No frame is stored that comes later." );
  EXPECT_EQ( Long.After( 5 * 3600.0 - 599.0 ), "" );
  VLimitNotice Short( "vi:0", { 2000.0, "the index of an AVI file", true } );
  EXPECT_EQ( Short.After( 1899.0 ), "" );
  EXPECT_NE( Short.After( 1900.0 ), "" );
  EXPECT_EQ( VLimitNotice( "vi:0", {} ).After( 1e12 ), "" );
}
