// Files of many GiB, into a stream that forgets images, and numbers that 32 bits do not hold.
#include "tests/FileIO/RapidAVI/AviFile.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SparseFile.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <map>

using namespace KVZ;
using namespace RapidAVI;

namespace
{

// A buffer that says it is long. Its bytes are not there.
class VLongBuffer : public IBufferConst
{
public:
  explicit VLongBuffer( uint64_t i_Size ) : m_Size( i_Size ) {}
  const uint8_t* Data() const override { return nullptr; }
  size_t Size() const override { return m_Size; }

private:
  const size_t m_Size;
};

// An index of full length is no image.
constexpr size_t SmallestImage = 20000;

class LargeAvi : public testing::Test
{
protected:
  const TestSupport::VLogCapture m_Log{ "RapidAVI" };
};

}

TEST_F( LargeAvi, NumbersThatAFieldCannotHoldAreRefused )
{
  const auto WritesHeader = []( const VSettings& i_rSettings ) { return VAviFile( i_rSettings ).OpenAndWriteHeader(); };
  VSettings Settings;
  Settings.m_Video = Video( IPixelFormat::EB8G8R8u8, 65536, 1 );
  EXPECT_FALSE( WritesHeader( Settings ) );
  Settings.m_Video = Video( IPixelFormat::EB8G8R8u8, 32768, 32768 );
  EXPECT_FALSE( WritesHeader( Settings ) );
  Settings.m_Video = Video( IPixelFormat::EB8G8R8u8, 7680, 4320 );
  EXPECT_TRUE( WritesHeader( Settings ) );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "A width in pixels of 65536 cannot be stored: 65535 is the limit.",
      "An image size in bytes of 4294967296 cannot be stored: 4294967295 is the limit." } ) );
  // The data rate is no more than a hint.
  Settings.m_Timing.m_FramePeriodInTicks = 2700000;
  VAviFile File( Settings );
  ASSERT_TRUE( File.OpenAndWriteHeader() );
  constexpr size_t RatePosition = 12 + 12 + 8 + 4;   // RIFF, LIST and avih, then the period
  EXPECT_EQ( VBytes( File.m_pBytes->begin() + RatePosition, File.m_pBytes->begin() + RatePosition + 4 ), VBytes( 4, 0xFF ) );
}

TEST_F( LargeAvi, PositionsBeyond4GiBAreIndexed )
{
  constexpr uint32_t Side = 32768;
  constexpr uint64_t FrameBytes = uint64_t{ Side } * Side;   // 1 GiB
  VSettings Settings;
  Settings.m_Video = Video( IPixelFormat::ELuminance8, Side, Side );
  Settings.m_Timing.m_FramePeriodInTicks = 135000000;
  Settings.m_Audio = {};
  TestSupport::VSparseFile::VPieces Pieces;
  VRapidAVIWriter Writer( {}, [&]( const std::string& ) { return std::make_unique<TestSupport::VSparseFile>( Pieces, SmallestImage ); } );
  ASSERT_TRUE( Writer.Open( "sparse" ) );
  ASSERT_TRUE( Settings.WriteHeader( Writer ) );
  for( uint64_t Key = 0; Key < 7; ++Key )
  {
    ASSERT_TRUE( Writer.WriteFrame( VFrameSet{ std::make_shared<VLongBuffer>( FrameBytes ), Settings.m_Video, {}, {} }, Key ) );
  }
  ASSERT_TRUE( Writer.Close() );

  // Frames in each RIFF: 1, 2, 2, 2. A chunk of one GiB closes the first and the second one closes each other.
  // RIFF, hdrl and avih; strl, strh, strf with its palette and indx; odml and dmlh; movi
  constexpr uint64_t FirstBase = ( 12 + 12 + 64 ) + ( 12 + 64 + 1072 + 8 + 0x4018 ) + ( 12 + 256 ) + 12;
  const auto Found = std::find_if( Pieces.begin(), Pieces.end(),
    []( const auto& i_rPiece ) { return i_rPiece.second.size() == 4 * sizeof( VSuperIndexEntry ); } );
  ASSERT_NE( Found, Pieces.end() );
  std::array<VSuperIndexEntry, 4> Entries;
  std::memcpy( Entries.data(), Found->second.data(), sizeof( Entries ) );
  uint64_t Expected = FirstBase + 8 + FrameBytes;
  for( size_t Entry = 0; Entry < Entries.size(); ++Entry )
  {
    const uint32_t Frames = Entry == 0 ? 1 : 2;
    EXPECT_EQ( uint64_t{ Entries[Entry].m_Position }, Expected ) << Entry;
    EXPECT_EQ( uint32_t{ Entries[Entry].m_Duration }, Frames );
    VStandardIndexHeader Header;
    std::memcpy( &Header, Pieces.at( Expected + 8 ).data(), sizeof( Header ) );
    EXPECT_EQ( uint64_t{ Header.m_BasePosition }, Expected - Frames * ( 8 + FrameBytes ) );
    // The rest of this index, "idx1" of the first RIFF, and the heads of the next one with two frames.
    Expected += 8 + 24 + Frames * 8 + ( Entry == 0 ? 8 + 16 : 0 ) + 24 + 2 * ( 8 + FrameBytes );
  }
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( LargeAvi, WhatDoesNotFit32BitsIsRefusedByName )
{
  VSettings Settings;
  Settings.m_Audio = { IAudioSampleFormat::EUInt8, 48000, 1 };
  TestSupport::VSparseFile::VPieces Pieces;
  const auto WriteSounds = [&]( const VSegmentLimits& i_rLimits, const std::vector<uint64_t>& i_rSizes )
  {
    VRapidAVIWriter Writer(
      {}, [&]( const std::string& ) { return std::make_unique<TestSupport::VSparseFile>( Pieces, SmallestImage ); }, i_rLimits );
    EXPECT_TRUE( Writer.Open( "sparse" ) );
    EXPECT_TRUE( Settings.WriteHeader( Writer ) );
    size_t Written = 0;
    for( const uint64_t Size : i_rSizes )
    {
      Written += Writer.WriteFrame(
        VFrameSet{ Buffer( Noise( 8, 0 ) ), Settings.m_Video, { std::make_shared<VLongBuffer>( Size ) }, Settings.m_Audio },
        VRapidAVIWriter::AppendKey );
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
