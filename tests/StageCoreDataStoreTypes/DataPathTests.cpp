#include "StageCoreDataStoreTypes/DataPath.h"

#include <gtest/gtest.h>

TEST( DataPath, JoinsItsSegmentsByDots )
{
  EXPECT_EQ( VDataPath().ToString(), "" );
  EXPECT_EQ( VDataPath( { "Camera" } ).ToString(), "Camera" );
  EXPECT_EQ( ( VDataPath{ "VideoInput", "vi:0" } + "Settings" ).ToString(), "VideoInput.vi:0.Settings" );
}

TEST( DataPath, ReadsBackWhatItJoined )
{
  for( const char* pText : { "", "Camera", "VideoInput.vi:0.Settings.Enabled", "VideoInput.*.Settings" } )
  {
    EXPECT_EQ( VDataPath::FromString( pText ).ToString(), pText );
  }
  EXPECT_EQ( VDataPath::FromString( ".A..B." ).ToString(), "A.B" );
  EXPECT_TRUE( VDataPath::FromString( "A.*" ).IsWildcard() );
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

TEST( DataPath, CanBeAddedToItself )
{
  VDataPath Path{ "A", "B" };
  EXPECT_EQ( Path.Add( Path ).ToString(), "A.B.A.B" );
}

TEST( DataPathHandle, OfAWildcardIsEmpty )
{
  EXPECT_TRUE( VDataPathHandle( VDataPath{ "VideoInput", "*" } ).Path().IsEmpty() );
  EXPECT_EQ( VDataPathHandle( VDataPath{ "A" } ).Path().ToString(), "A" );
}

TEST( DataPathHandle, IsBoundByTheFirstStoreAlone )
{
  int FirstNode = 0;
  int SecondNode = 0;
  const VDataPathHandle Handle( VDataPath{ "A" } );
  EXPECT_EQ( Handle.Binding().Find( 5 ), nullptr );
  Handle.Binding().Bind( 5, &FirstNode );
  Handle.Binding().Bind( 6, &SecondNode );
  EXPECT_EQ( Handle.Binding().Find( 5 ), &FirstNode );
  EXPECT_EQ( Handle.Binding().Find( 6 ), nullptr );
  EXPECT_EQ( VDataPathHandle( Handle ).Binding().Find( 5 ), nullptr );
}
