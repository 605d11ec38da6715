#include "HardwareSupport/VideoInput/VideoInputDataSource/DeviceUrnMap.h"

#include <gtest/gtest.h>

namespace
{

using VideoInputHAL::VDeviceUrnHash;
using VideoInputHAL::VDeviceUrnMap;

// Published test vectors of 64-bit FNV-1a.
TEST( DeviceUrnHash, IsFnv1a )
{
  EXPECT_EQ( VDeviceUrnHash()( "" ), 0xCBF29CE484222325u );
  EXPECT_EQ( VDeviceUrnHash()( "a" ), 0xAF63DC4C8601EC8Cu );
  EXPECT_EQ( VDeviceUrnHash()( "foobar" ), 0x85944171F73967E8u );
}

TEST( DeviceUrnMap, KeepsTheOrderOfArrivalAndTheFirstOfTwoWithOneName )
{
  VDeviceUrnMap<int> Map;
  for( int Index = 0; Index < 40; ++Index )   // beyond the first buckets
  {
    EXPECT_TRUE( Map.Insert( "vi:" + std::to_string( Index ), Index ) );
  }
  EXPECT_FALSE( Map.Insert( "vi:7", 700 ) );
  EXPECT_EQ( Map.Size(), 40u );
  EXPECT_EQ( *Map.Find( "vi:7" ), 7 );
  EXPECT_EQ( Map.Find( "vi:40" ), nullptr );
  for( int Index = 0; const auto& rEntry : Map )
  {
    EXPECT_EQ( rEntry.first, "vi:" + std::to_string( Index ) );
    EXPECT_EQ( rEntry.second, Index++ );
  }
}

}
