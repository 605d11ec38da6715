#include "StageCoreDataStoreTypes/DataPath.h"

#include <gtest/gtest.h>

TEST( DataPath, JoinsItsSegmentsByDotsAndReadsThemBack )
{
  EXPECT_EQ( ( VDataPath{ "VideoInput", "vi:0" } + "Settings" ).ToString(), "VideoInput.vi:0.Settings" );
  for( const char* pText : { "", "Camera", "VideoInput.vi:0.Settings.Enabled", "VideoInput.*.Settings" } )
  {
    EXPECT_EQ( VDataPath::FromString( pText ).ToString(), pText );
  }
  EXPECT_EQ( VDataPath::FromString( ".A..B." ).ToString(), "A.B" );
  EXPECT_TRUE( VDataPath::FromString( "A.*" ).IsWildcard() );
  VDataPath Path{ "A", "B" };
  EXPECT_EQ( Path.Add( Path ).ToString(), "A.B.A.B" );
}

TEST( DataPath, OnlyASegmentThatIsExactlyAStarIsAWildcard )
{
  EXPECT_FALSE( VDataPath( { "**", "a*", "*a" } ).IsWildcard() );
  const VDataPath Wildcard = VDataPath{ "VideoInput" } + "*";
  EXPECT_TRUE( Wildcard.IsWildcard() );
  EXPECT_TRUE( ( VDataPath{ "Attributes" } + Wildcard ).IsWildcard() );
  EXPECT_TRUE( ( Wildcard + VDataPath{ "Settings" } ).IsWildcard() );
  EXPECT_FALSE( Wildcard.Parent().IsWildcard() );
}

TEST( DataPath, BeginsWithComparesWholeSegments )
{
  const VDataPath Path{ "VideoInput", "vi:0", "Settings" };
  EXPECT_TRUE( Path.BeginsWith( Path ) );
  EXPECT_TRUE( Path.BeginsWith( { "VideoInput", "vi:0" } ) );
  EXPECT_TRUE( Path.BeginsWith( {} ) );
  EXPECT_TRUE( VDataPath().BeginsWith( {} ) );
  EXPECT_FALSE( Path.BeginsWith( { "VideoInput", "vi:" } ) );
  EXPECT_FALSE( Path.BeginsWith( { "VideoInput", "vi:00" } ) );
  EXPECT_FALSE( Path.BeginsWith( { "VideoInput", "*" } ) );
  EXPECT_FALSE( VDataPath( { "VideoInput" } ).BeginsWith( Path ) );
}
