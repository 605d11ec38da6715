// Files of many GiB, into a stream that forgets images, and numbers that 32 bits do not hold.
#include "tests/FileIO/RapidAVI/AviFile.h"
#include "tests/support/EndlessBuffer.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SparseFile.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace RapidAVI;
using namespace TestSupport;

namespace
{

// An index of full length is no image.
constexpr size_t SmallestImage = 20000;

class LargeAvi : public testing::Test
{
protected:
  const VLogCapture m_Log{ "RapidAVI" };
};

}

TEST_F( LargeAvi, NumbersThatAFieldCannotHoldAreRefused )
{
  const auto WritesHeader = []( uint32_t i_Width, uint32_t i_Height )
  { return VAviFile( VSettings( VideoInfo( IPixelFormat::EB8G8R8u8, i_Width, i_Height ) ) ).Begin(); };
  EXPECT_FALSE( WritesHeader( 65536, 1 ) );
  EXPECT_FALSE( WritesHeader( 32768, 32768 ) );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "A width in pixels of 65536 cannot be stored: 65535 is the limit.",
      "An image size in bytes of 4294967296 cannot be stored: 4294967295 is the limit." } ) );
  // The data rate is no more than a hint.
  VSettings Settings( VideoInfo( IPixelFormat::EB8G8R8u8, 7680, 4320 ) );
  Settings.m_Timing.m_FramePeriodInTicks = 2700000;
  VAviFile File( Settings );
  ASSERT_TRUE( File.Begin() );
  constexpr size_t RatePosition = 12 + 12 + 8 + 4;   // RIFF, LIST and avih, then the period
  EXPECT_EQ( VBytes( File.m_pBytes->begin() + RatePosition, File.m_pBytes->begin() + RatePosition + 4 ), VBytes( 4, 0xFF ) );
}

TEST_F( LargeAvi, WhatDoesNotFit32BitsIsRefusedByName )
{
  VSettings Settings;
  Settings.m_Audio = { IAudioSampleFormat::EUInt8, 48000, 1 };
  VSparseFile::VPieces Pieces;
  const auto WriteSounds = [&]( const VSegmentLimits& i_rLimits, const std::vector<uint64_t>& i_rSizes )
  {
    VRapidAVIWriter Writer(
      {}, [&]( const std::string& ) { return std::make_unique<VSparseFile>( Pieces, SmallestImage ); }, i_rLimits );
    EXPECT_TRUE( Writer.Open( "sparse" ) );
    EXPECT_TRUE( Settings.WriteTo( Writer ) );
    size_t Written = 0;
    for( const uint64_t Size : i_rSizes )
    {
      Written += Writer.WriteFrame(
        VFrameSet{ Buffer( Noise( 8, 0 ) ), Settings.m_Video, { std::make_shared<VEndlessBuffer>( Size ) }, Settings.m_Audio }, AppendKey );
    }
    EXPECT_TRUE( Writer.Close() );
    return Written;
  };
  constexpr uint64_t GiB = uint64_t{ 1 } << 30;
  constexpr VSegmentLimits Usual;
  constexpr VSegmentLimits Endless{ 100 * GiB, 100 * GiB };
  EXPECT_EQ( WriteSounds( Usual, { 3 * GiB, GiB - 1, 1, 0 } ), 3u );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "The file is full: it can count no more than 4294967295 samples of sound." } );
  EXPECT_EQ( WriteSounds( Usual, { 4 * GiB } ), 0u );
  Settings.m_Audio.m_Channels = 8;
  EXPECT_EQ( WriteSounds( Usual, { 4 * GiB } ), 0u );
  EXPECT_EQ( WriteSounds( Endless, { 2 * GiB, 2 * GiB, GiB } ), 2u );
  EXPECT_EQ( m_Log.Texts().at( 2 ), "A chunk of 4294967296 bytes cannot be stored: 4294967295 is the limit." );
  EXPECT_EQ( m_Log.Texts().at( 3 ),
    "A chunk of 2147483648 bytes cannot be stored: its RIFF would be longer than 4294967295 bytes, which is the limit." );
}
