#include "FileIO/ImageSequenceIO/FileNames.h"

#include <gtest/gtest.h>

using namespace ImageSequenceIO;
using KVZ::ITimecode;
using KVZ::ITimecodeStandard;

namespace
{

const ITimecode Start25 = ITimecode{ ITimecodeStandard::ETimecode25, 1, 2, 3, 4 };

}

TEST( ImageFileNames, KeywordsGiveWayToNumberAndTimecode )
{
  EXPECT_EQ( MakeFileName( "take_%FRAME%", { 12 } ), "take_00000012" );
  EXPECT_EQ( MakeFileName( "%FRAME%-%FRAME%", { 7, 3 } ), "007-007" );
  EXPECT_EQ( MakeFileName( "%FRAME%", { 123456789012 } ), "123456789012" ) << "more digits than the pad";
  EXPECT_EQ( MakeFileName( "%TIMECODE%", { 0, 8, Start25 } ), "01020304" );
  EXPECT_EQ( MakeFileName( "%TIMECODE%", { 0, 8, ITimecode{ ITimecodeStandard::ETimecode30Drop, 1, 2, 3, 4 } } ), "01020304" );
  EXPECT_EQ( MakeFileName( "%TIMECODE%", { 0, 8, {} } ), "none" );
  EXPECT_EQ( MakeFileName( "still", { 12 } ), "still" );
}

TEST( ImageFileNames, TheSideFileHasNoKeywordAndAnExtensionOfItsOwn )
{
  EXPECT_EQ( MakeSideFileName( "take_%FRAME%" ), "take_.tarvovideoattributes" );
  EXPECT_EQ( MakeSideFileName( "take.%TIMECODE%" ), "take.tarvovideoattributes" );
  EXPECT_EQ( MakeSideFileName( "a.b_%FRAME%%TIMECODE%" ), "a.tarvovideoattributes" );
  EXPECT_EQ( MakeSideFileName( "%FRAME%" ), ".tarvovideoattributes" );
}

TEST( ImageFileNames, TheTimecodeGoesOnWithTheFrames )
{
  const KVZ::VTimingRecord Timing{ 135000000, 5400000, 0 };
  EXPECT_EQ( KVZ::ToText( TimecodeOfFrame( Start25, Timing, 25 * 60 ) ), "01:03:03:04" );
  EXPECT_EQ( KVZ::ToText( TimecodeOfFrame( Start25, { 25000, 1000, 0 }, 3 ) ), "01:02:03:07" ) << "another tick rate";
  EXPECT_EQ( KVZ::ToText( TimecodeOfFrame( Start25, { 0, 1000, 0 }, 3 ) ), "01:02:03:04" );
  EXPECT_EQ( KVZ::ToText( TimecodeOfFrame( Start25, { 7, 3, 0 }, 3 ) ), "01:02:03:04" ) << "no whole number of ticks";
  const ITimecode Drop = ITimecode{ ITimecodeStandard::ETimecode30Drop, 0, 0, 59, 29 };
  EXPECT_EQ( KVZ::ToText( TimecodeOfFrame( Drop, { 135000000, 4504500, 0 }, 1 ) ), "00:01:00;02" );
}

TEST( ImageFileNames, TheNumberIsFoundAgain )
{
  EXPECT_EQ( FindFrameNumber( "take_00000012.jpg", "take_%FRAME%" ), 12u );
  EXPECT_EQ( FindFrameNumber( "0102030405-7-8", "%TIMECODE%-%FRAME%-%FRAME%" ), 7u );
  EXPECT_EQ( FindFrameNumber( "a+(b)[1]{2}^$.*?|\\_0042.png", "a+(b)[1]{2}^$.*?|\\_%FRAME%" ), 42u );
  EXPECT_EQ( FindFrameNumber( "18446744073709551614", "%FRAME%" ), 18446744073709551614u );
  for( const char* pOther : { "shot_00000012.jpg", "take_.jpg", "take", "take_18446744073709551616", "" } )
  {
    EXPECT_EQ( FindFrameNumber( pOther, "take_%FRAME%" ), NoFrameNumber ) << pOther;
  }
  EXPECT_EQ( FindFrameNumber( "still.jpg", "still" ), NoFrameNumber );
  EXPECT_EQ( FindFrameNumber( "a.b", "aXb%FRAME%" ), NoFrameNumber );
}
