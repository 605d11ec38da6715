#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/DeckLinkFixture.h"

#include <numeric>

namespace
{

using namespace DeckLinkAPI;
using KVZ::IInterlacedFormat;
using KVZ::IPixelFormat;
using KVZ::IVideoStandard;

Fake::VFrameContent Numbered( const Fake::VFrameContent& i_rFrame )
{
  Fake::VFrameContent Frame = i_rFrame;
  Frame.m_Bytes.resize( static_cast<size_t>( Frame.m_RowBytes * Frame.m_Height ) );
  std::iota( Frame.m_Bytes.begin(), Frame.m_Bytes.end(), uint8_t( 1 ) );
  return Frame;
}

Fake::VAudioContent Samples( long i_Samples, size_t i_BytesPerFrame )
{
  Fake::VAudioContent Audio{ i_Samples, std::vector<uint8_t>( static_cast<size_t>( i_Samples ) * i_BytesPerFrame ) };
  std::iota( Audio.m_Bytes.begin(), Audio.m_Bytes.end(), uint8_t( 101 ) );
  return Audio;
}

const Fake::VFrameContent NoInput{ .m_Flags = FrameFlag::NoInputSource };

TEST_F( DeckLinkDevice, DeliversImageAndSoundInOneBlock )
{
  InitialiseAndCapture( 2 );
  const auto Video = Numbered( {} );
  const auto Audio = Samples( 3, 4 );
  KVZ::VideoFrameInfo VideoInfo;
  VideoInfo.m_ImageWidth = 48;
  VideoInfo.m_ImageHeight = 2;
  VideoInfo.m_PixelFormat = UYVY;
  VideoInfo.m_InterlacedFormat = IInterlacedFormat::EInterlacedFrameUnspecifiedLineTiming;
  ExpectHeader( Delivered( Video, Audio ), VideoInfo, 192, 12 );

  DeliverFormat( FourCharacterCode( "Hp25" ) );
  const VReceivedFrame Frame = Delivered( Video, Audio );
  VideoInfo.m_InterlacedFormat = IInterlacedFormat::ENotInterlaced;
  ExpectHeader( Frame, VideoInfo, 192, 12 );
  EXPECT_EQ( Frame.m_Image, Video.m_Bytes );
  EXPECT_EQ( Frame.m_Audio, Audio.m_Bytes );
  EXPECT_EQ( Frame.m_Period, 5400000 );
}

TEST_F( DeckLinkDevice, AFrameWithoutSoundHasNoAudioRecord )
{
  InitialiseAndCapture( 2 );
  EXPECT_TRUE( Delivered( {} ).m_Header.m_AudioInfo.IsEmpty() );

  // Packets may go on coming from an earlier capture's audio.
  Capture();
  const VReceivedFrame Frame = Delivered( {}, Samples( 3, 4 ) );
  EXPECT_TRUE( Frame.m_Header.m_AudioInfo.IsEmpty() );
  EXPECT_TRUE( Frame.m_Audio.empty() );
  EXPECT_EQ( m_pAllocator->m_LastBytes, 8192u );
}

TEST_F( DeckLinkDevice, NeverTakesMoreSoundThanThePacketHolds )
{
  // Asked for as 16 bits, whatever the format would need
  InitialiseAndCapture( 2, KVZ::IAudioSampleFormat::EFloat32 );
  EXPECT_EQ( Delivered( {}, Samples( 5, 4 ) ).m_Audio.size(), 20u );
  Capture( 2, KVZ::IAudioSampleFormat::EInt32 );
  EXPECT_EQ( Delivered( {}, Samples( 5, 8 ) ).m_Audio.size(), 40u );
}

// Ten-bit rows are padded to whole groups, a format that nobody knows counts as grey, and what a short frame lacks is blank.
TEST_F( DeckLinkDevice, AnImageIsAsLargeAsItsFormatSays )
{
  const struct
  {
    Fake::VFrameContent m_Video;
    IPixelFormat::Enum m_Format;
    size_t m_Bytes;
  } Rows[] = {
    { Numbered( { .m_Width = 50, .m_Height = 3, .m_RowBytes = 256, .m_PixelFormat = PixelFormat::YUV10Bit } ), IPixelFormat::EU10Y10V10Y10, 768 },
    { Numbered( { .m_RowBytes = 90 } ), UYVY, 192 },
    { Numbered( { .m_RowBytes = 48, .m_PixelFormat = PixelFormat::RGB10Bit } ), IPixelFormat::ELuminance8, 96 },
  };
  InitialiseAndCapture();
  for( const auto& rRow : Rows )
  {
    const VReceivedFrame Frame = Delivered( rRow.m_Video );
    EXPECT_EQ( Frame.m_Header.m_VideoInfo.m_PixelFormat, rRow.m_Format );
    auto Expected = rRow.m_Video.m_Bytes;
    Expected.resize( rRow.m_Bytes, 0 );
    EXPECT_EQ( Frame.m_Image, Expected );
  }
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Unsupported pixel format." } ) );
}

TEST_F( DeckLinkDevice, ALostFrameCostsThatFrameOnly )
{
  const struct
  {
    const char* m_pMessage;
    Fake::VFrameContent m_Video;
    std::optional<Fake::VAudioContent> m_Audio;
    bool m_bExhausted = false;
  } Rows[] = {
    { "Could not get bytes from video frame.", { .m_Failures = { "GetBytes" } }, {} },
    { "Need more memory than was to be requested.", Numbered( { .m_RowBytes = 97 } ), {} },
    { "Could not get bytes from audio packet.", {}, Fake::VAudioContent{ 3, std::vector<uint8_t>( 12 ), true } },
    { "Memory allocation failed.", {}, {}, true },
  };
  InitialiseAndCapture( 2 );
  for( uint32_t Index = 0; const auto& rRow : Rows )
  {
    SCOPED_TRACE( rRow.m_pMessage );
    m_Log.Clear();
    m_pAllocator->m_bExhausted = rRow.m_bExhausted;
    EXPECT_TRUE( Input().DeliverFrame( rRow.m_Video, rRow.m_Audio ) );
    EXPECT_EQ( m_pReceiver->Count(), Index );
    EXPECT_EQ( m_Log.Texts(), VCalls{ rRow.m_pMessage } );
    EXPECT_EQ( m_Log.Lines()[0].m_Level, 2 );

    m_pAllocator->m_bExhausted = false;
    EXPECT_EQ( Delivered( {} ).m_Index, Index++ );
  }
}

TEST_F( DeckLinkDevice, WhatNobodyTakesGoesBackToTheAllocator )
{
  InitialiseAndCapture();
  m_pReceiver->m_bAccept = false;
  Delivered( {} );
  EXPECT_EQ( m_pAllocator->m_Outstanding, 0 );
  m_pReceiver->m_bAccept = true;
  EXPECT_EQ( Delivered( {} ).m_Index, 1u );

  const std::weak_ptr<VFrameReceiver> pFormer = m_pReceiver;
  m_pReceiver = std::make_shared<VFrameReceiver>();
  EXPECT_TRUE( pFormer.expired() );
  EXPECT_TRUE( Input().DeliverFrame( {} ) );
  EXPECT_EQ( m_pAllocator->m_Outstanding, 0 );
  m_pDevice->SetDataCallback( m_pReceiver );
  m_pDevice->SetAllocator( nullptr );
  EXPECT_TRUE( Input().DeliverFrame( {} ) );
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Memory allocation failed." } ) );
  EXPECT_EQ( m_pReceiver->Count(), 0u );
}

TEST_F( DeckLinkDevice, LossOfSignalOnlyTogglesTheState )
{
  const VFired Toggled{ { "standard", 1 }, { "formats", 1 } };
  InitialiseAndCapture( 2 );
  Input().DeliverFrame( NoInput );
  EXPECT_TRUE( Input().DeliverAudioOnly( Samples( 3, 4 ) ) );
  EXPECT_EQ( Fired(), VFired() );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EUnspecified );

  Delivered( {} );
  EXPECT_EQ( Fired(), Toggled );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::ESD_720_486I_5994 );

  Input().DeliverFrame( NoInput );
  EXPECT_EQ( Fired(), Toggled );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EUnspecified );
  Input().DeliverFrame( NoInput );
  EXPECT_EQ( Fired(), VFired() );
  EXPECT_EQ( m_pReceiver->Count(), 1u );
}

TEST_F( DeckLinkDevice, CountsTheFramesThatTheCardClockSawPass )
{
  constexpr int64_t Period = 5400000;
  InitialiseAndCapture();
  const auto Deliver = [this]( int64_t i_HardwareTime ) { Delivered( { .m_Duration = Period, .m_HardwareTime = i_HardwareTime } ); };
  // Frames without card time count nothing
  Delivered( { .m_HardwareTime = 9 * Period, .m_Failures = { "GetHardwareReferenceTimestamp" } } );
  Delivered( { .m_Duration = 0, .m_HardwareTime = 9 * Period } );
  Deliver( 1000 * Period );   // the card has run for 999 frames before this one
  Deliver( 1001 * Period );
  Deliver( 1002 * Period + Period / 2 );   // late, but none is missing
  Deliver( 1006 * Period );
  m_pDevice->StopCapture();
  Input().DeliverFrame( { .m_Duration = Period, .m_HardwareTime = 1007 * Period } );   // seen, but not captured
  Capture();
  Deliver( 1010 * Period );
  Deliver( 5 * Period );   // the clock began anew
  Deliver( 6 * Period );
  m_pService->RunAll();
  EXPECT_EQ( m_Dropped, ( std::vector<unsigned int>{ 999, 2, 3 } ) );
}

}
