#include "StageCoreRuntime/SanitizerBuild.h"
#include "Utils/UtilsIO/StreamAdapters.h"

#include <gtest/gtest.h>

using namespace KVZ;

TEST( StreamAdapters, MemoryBehavesLikeAFile )
{
  std::vector<uint8_t> Bytes{ 1, 2, 3 };
  ISimpleStreamAdapter Stream( Bytes );
  const uint8_t Written[] = { 7, 8 };
  EXPECT_TRUE( Stream.Seek( 2 ) && Stream.Write( Written, 2 ) );
  EXPECT_TRUE( Stream.Seek( 6 ) && Stream.Write( Written, 1 ) );
  EXPECT_EQ( Bytes, ( std::vector<uint8_t>{ 1, 2, 7, 8, 0, 0, 7 } ) );
  EXPECT_TRUE( Stream.IsEnd() );

  uint8_t Read[8] = {};
  EXPECT_TRUE( Stream.Seek( 5 ) );
  EXPECT_FALSE( Stream.Read( Read, 3 ) );
  EXPECT_FALSE( Stream.Write( Written, 0 ) );
  EXPECT_TRUE( Stream.Seek( 5 ) && Stream.Read( Read, 2 ) );
  EXPECT_EQ( Read[1], 7 );
  EXPECT_FALSE( Stream.Seek( ~uint64_t{ 0 } ) );
  // A sanitizer ends the process at an allocation of this size.
  if constexpr( !DebugServices::IsSanitizerBuild )
  {
    EXPECT_TRUE( Stream.Seek( Bytes.max_size() - 1 ) );
    EXPECT_FALSE( Stream.Write( Written, 1 ) || Stream.IsGood() );
    EXPECT_EQ( Bytes.size(), 7u );
  }
}

TEST( StreamAdapters, ReadingMemoryEndsAtItsEnd )
{
  const std::vector<uint8_t> Bytes{ 1, 2, 3, 4, 5 };
  ISimpleInputStreamAdapter Stream( Bytes );
  uint8_t Read[8] = {};
  size_t Count = 0;
  EXPECT_TRUE( Stream.Seek( 3 ) && Stream.ReadBlock( Read, 8, Count ) );
  EXPECT_EQ( Count, 2u );
  EXPECT_TRUE( Stream.IsEnd() && Stream.IsGood() );
  EXPECT_FALSE( Stream.Seek( 6 ) );
  EXPECT_FALSE( Stream.Read( Read, 1 ) );
  EXPECT_TRUE( Stream.Seek( 0 ) && Stream.Read( Read, 5 ) );

  IInputStreamAdapter<ISimpleInputStreamAdapter> Forwarding( Stream );
  EXPECT_TRUE( Forwarding.IsEnd() && Forwarding.IsGood() );
  EXPECT_FALSE( Forwarding.Read( Read, 1 ) );
  EXPECT_FALSE( Forwarding.IsGood() || Forwarding.ReadBlock( Read, 1, Count ) );
}

TEST( StreamAdapters, AListOfPiecesStopsAtTheFirstFailure )
{
  struct VTarget
  {
    bool Write( const void*, size_t i_Size )
    {
      m_Sizes.push_back( i_Size );
      return i_Size != 2;
    }
    std::vector<size_t> m_Sizes;
  } Target;
  IOutputStreamAdapter<VTarget> Stream( Target );
  const char Bytes[4] = {};
  EXPECT_FALSE( Stream.Write( { { Bytes, 1 }, { Bytes, 2 }, { Bytes, 3 } } ) );
  EXPECT_TRUE( Stream.Write( IStandardBuffer( 4 ) ) );
  EXPECT_EQ( Target.m_Sizes, ( std::vector<size_t>{ 1, 2, 4 } ) );
}
