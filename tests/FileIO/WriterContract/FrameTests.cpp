// Frames: their keys, their pieces and their sound.
#include "tests/FileIO/WriterContract/ContractWriter.h"

using namespace KVZ;

namespace WriterContract
{

namespace
{

// In pieces of different sizes, one of them empty.
VBufferList Pieces( const VBytes& i_rBytes )
{
  const auto Middle = i_rBytes.begin() + static_cast<std::ptrdiff_t>( i_rBytes.size() / 3 );
  return { Buffer( { i_rBytes.begin(), Middle } ), Buffer( {} ), Buffer( { Middle, i_rBytes.end() } ) };
}

}

TEST_P( WriterContract, KeysAreWhatTheContainerTakes )
{
  VContractWriter Contract( GetParam() );
  ASSERT_TRUE( Contract.Begin() );
  const bool bCounting = GetParam().m_Keys == EKeys::Counting;
  EXPECT_EQ( Contract.WriteFrame( 0, 5 ), !bCounting );
  EXPECT_TRUE( Contract.WriteFrame( 0, 0 ) );
  EXPECT_EQ( Contract.WriteFrame( 1, AppendKey ), GetParam().m_Keys != EKeys::Set );
  EXPECT_EQ( Contract.WriteFrame( 2, 3 ), !bCounting );
  EXPECT_TRUE( Contract.WriteFrame( 2, 2 ) );
  EXPECT_EQ( Contract.WriteFrame( 2, 1 ), !bCounting );
  EXPECT_TRUE( Contract.Writer().Close() );
}

TEST_P( WriterContract, PiecesMakeTheSameFrame )
{
  VContractWriter Contract( GetParam() );
  VContractWriter InOne( GetParam() );
  ASSERT_TRUE( Contract.Begin() && InOne.Begin() && InOne.WriteFrame( 0 ) );
  VBufferList Video = Pieces( Contract.Picture( 0 ) );
  // A buffer of sound never ends within a sample
  VBufferList Audio = { Buffer( Contract.Sound( 0 ) ), Buffer( {} ), Buffer( Contract.Sound( 50 ) ) };
  ASSERT_TRUE( Contract.Writer().WriteFrame( Video, Contract.Header().m_Video, Audio, Contract.Header().m_Audio, 0 ) );
  EXPECT_TRUE( Contract.Writer().Close() && InOne.Writer().Close() );
  if( GetParam().m_bOneFile )
  {
    EXPECT_TRUE( Contract.Holds( Contract.Picture( 0 ) ) );
    EXPECT_TRUE( Contract.Holds( Contract.Sound( 0 ) ) );
    EXPECT_TRUE( Contract.Holds( Contract.Sound( 50 ) ) );
    return;
  }
  EXPECT_EQ( Contract.Files().size(), 2u );
  EXPECT_EQ( *Contract.Files().rbegin()->second, *InOne.Files().rbegin()->second ) << "the image, behind the attributes";
}

TEST_P( WriterContract, FramesOfAnotherSizeAreRefused )
{
  VContractWriter Contract( GetParam() );
  ASSERT_TRUE( Contract.Begin() );
  const auto Write = [&]( const VBytes& i_rPicture, const VideoFrameInfo& i_rInfo )
  {
    VBufferList Video = { Buffer( i_rPicture ) };
    VBufferList Audio;
    return Contract.Writer().WriteFrame( Video, i_rInfo, Audio, Contract.Header().m_Audio, 0 );
  };
  const VideoFrameInfo& rInfo = Contract.Header().m_Video;
  const VBytes Picture = Contract.Picture( 0 );
  EXPECT_FALSE( Write( VBytes( Picture.begin(), Picture.end() - 1 ), rInfo ) );
  if( GetParam().m_bOneFile )
  {
    VideoFrameInfo Turned = rInfo;
    std::swap( Turned.m_ImageWidth, Turned.m_ImageHeight );
    EXPECT_FALSE( Write( Picture, Turned ) );
  }
  VBufferList Nothing;
  VBufferList Silence;
  EXPECT_FALSE( Contract.Writer().WriteFrame( Nothing, rInfo, Silence, {}, 0 ) );
  EXPECT_TRUE( Contract.WriteFrame( 0 ) ) << "what was refused has spoilt nothing";
  EXPECT_TRUE( Contract.Writer().Close() );
}

TEST_P( WriterContract, SoundHasTheHeadersChannels )
{
  if( !GetParam().m_bAudio )
  {
    return;
  }
  VContractWriter Contract( GetParam() );
  ASSERT_TRUE( Contract.Begin() );
  const auto Write = [&]( uint32_t i_Channels, const VBytes& i_rSound )
  {
    VBufferList Video = { Buffer( Contract.Picture( 0 ) ) };
    VBufferList Audio = { Buffer( i_rSound ) };
    return Contract.Writer().WriteFrame( Video, Contract.Header().m_Video, Audio, { IAudioSampleFormat::EInt16, 48000, i_Channels }, 0 );
  };
  EXPECT_FALSE( Write( 1, { 1, 2, 3, 4 } ) );
  EXPECT_TRUE( Write( 4, { 0xA1, 0xA2, 0xB1, 0xB2, 9, 9, 9, 9, 0xA3, 0xA4, 0xB3, 0xB4, 9, 9, 9, 9 } ) );
  EXPECT_TRUE( Contract.Writer().Close() );
  EXPECT_TRUE( Contract.Holds( { 0xA1, 0xA2, 0xB1, 0xB2, 0xA3, 0xA4, 0xB3, 0xB4 } ) );
}

}
