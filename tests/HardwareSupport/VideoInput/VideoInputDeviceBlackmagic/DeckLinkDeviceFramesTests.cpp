#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/DeckLinkFixture.h"

#include <numeric>

namespace
{

using namespace DeckLinkAPI;
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
  Input().DeliverFormat( FourCharacterCode( "Hp25" ), DetectedSignal::YCbCr422 );
  const auto Video = Numbered( {} );
  const auto Audio = Samples( 3, 4 );
  const VReceivedFrame Frame = Delivered( Video, Audio );

  EXPECT_EQ( m_pAllocator->m_LastBytes, 4096u + 4096u + 12u );
  EXPECT_EQ( Frame.m_Image, Video.m_Bytes );
  EXPECT_EQ( Frame.m_Audio, Audio.m_Bytes );
  EXPECT_EQ( Frame.m_Period, 5400000 );

  const auto& rHeader = Frame.m_Header;
  EXPECT_EQ( rHeader.m_pAllocator, m_pAllocator.get() );
  EXPECT_EQ( rHeader.m_DeviceIndex, 7 );
  KVZ::VideoFrameInfo VideoInfo;
  VideoInfo.m_ImageWidth = 48;
  VideoInfo.m_ImageHeight = 2;
  VideoInfo.m_PixelFormat = UYVY;
  VideoInfo.m_InterlacedFormat = KVZ::IInterlacedFormat::ENotInterlaced;
  EXPECT_EQ( rHeader.m_VideoInfo, VideoInfo );
  EXPECT_EQ( rHeader.m_AudioInfo, ( KVZ::AudioFrameInfo{ Int16, 48000, 2 } ) );
  EXPECT_EQ( rHeader.m_ImageBytes, 192u );
  EXPECT_EQ( rHeader.m_ImageCapacity, 4096u );
  EXPECT_EQ( rHeader.m_AudioBytes, 12u );
  EXPECT_EQ( rHeader.m_AudioCapacity, 12u );
}

TEST_F( DeckLinkDevice, AFrameWithoutSoundHasNoAudioRecord )
{
  InitialiseAndCapture( 2 );
  EXPECT_TRUE( Delivered( {} ).m_Header.m_AudioInfo.IsEmpty() );

  // Packets may go on coming from an earlier capture's audio.
  ASSERT_TRUE( m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, 0 ).Succeeded() );
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
  ASSERT_TRUE( m_pDevice->StartCapture( UYVY, AnyTimecode, KVZ::IAudioSampleFormat::EInt32, 2 ).Succeeded() );
  EXPECT_EQ( Delivered( {}, Samples( 5, 8 ) ).m_Audio.size(), 40u );
}

TEST_F( DeckLinkDevice, TenBitRowsArePaddedToWholeGroups )
{
  InitialiseAndCapture();
  const VReceivedFrame Frame = Delivered( Numbered( { .m_Width = 50, .m_Height = 3, .m_RowBytes = 256, .m_PixelFormat = PixelFormat::YUV10Bit } ) );
  EXPECT_EQ( Frame.m_Header.m_VideoInfo.m_PixelFormat, IPixelFormat::EU10Y10V10Y10 );
  EXPECT_EQ( Frame.m_Image.size(), 768u );
}

TEST_F( DeckLinkDevice, AShortFrameLeavesTheRestOfTheImageBlank )
{
  InitialiseAndCapture();
  const auto Video = Numbered( { .m_RowBytes = 90 } );
  const VReceivedFrame Frame = Delivered( Video );
  auto Expected = Video.m_Bytes;
  Expected.resize( 192, 0 );
  EXPECT_EQ( Frame.m_Image, Expected );
}

TEST_F( DeckLinkDevice, ALostFrameCostsThatFrameOnly )
{
  struct VRow
  {
    const char* m_pMessage;
    Fake::VFrameContent m_Video;
    std::optional<Fake::VAudioContent> m_Audio;
    bool m_bExhausted = false;
  };
  const VRow Rows[] = {
    { "Could not get bytes from video frame.", { .m_Failures = { "GetBytes" } }, {} },
    { "Need more memory than was to be requested.", Numbered( { .m_RowBytes = 97 } ), {} },
    { "Could not get bytes from audio packet.", {}, Fake::VAudioContent{ 3, std::vector<uint8_t>( 12 ), true } },
    { "Memory allocation failed.", {}, {}, true },
  };
  InitialiseAndCapture( 2 );
  uint32_t Index = 0;
  for( const VRow& rRow : Rows )
  {
    SCOPED_TRACE( rRow.m_pMessage );
    m_Log.Clear();
    m_pAllocator->m_bExhausted = rRow.m_bExhausted;
    const size_t Before = m_pReceiver->Count();
    EXPECT_TRUE( Input().DeliverFrame( rRow.m_Video, rRow.m_Audio ) );
    EXPECT_EQ( m_pReceiver->Count(), Before );
    EXPECT_EQ( m_Log.Texts(), VCalls{ rRow.m_pMessage } );
    EXPECT_EQ( m_Log.Lines()[0].m_Level, 2 );

    m_pAllocator->m_bExhausted = false;
    EXPECT_EQ( Delivered( {} ).m_Index, Index++ );
  }
}

TEST_F( DeckLinkDevice, AnUnknownPixelFormatCountsAsGrey )
{
  InitialiseAndCapture();
  const VReceivedFrame Frame = Delivered( Numbered( { .m_RowBytes = 48, .m_PixelFormat = PixelFormat::RGB10Bit } ) );
  EXPECT_EQ( Frame.m_Header.m_VideoInfo.m_PixelFormat, IPixelFormat::ELuminance8 );
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Unsupported pixel format." } ) );

  // As four bytes a pixel it is more than a grey image holds.
  Input().DeliverFrame( Numbered( { .m_RowBytes = 192, .m_PixelFormat = PixelFormat::ARGB8Bit } ) );
  EXPECT_EQ( m_pReceiver->Count(), 1u );
}

TEST_F( DeckLinkDevice, ARefusedBlockGoesBackToTheAllocator )
{
  InitialiseAndCapture();
  m_pReceiver->m_bAccept = false;
  Delivered( {} );
  EXPECT_EQ( m_pAllocator->m_Outstanding, 0 );
  m_pReceiver->m_bAccept = true;
  EXPECT_EQ( Delivered( {} ).m_Index, 1u );
}

TEST_F( DeckLinkDevice, ANullFrameIsIgnored )
{
  InitialiseAndCapture( 2 );
  EXPECT_TRUE( Input().DeliverAudioOnly( Samples( 3, 4 ) ) );
  EXPECT_EQ( m_pReceiver->Count(), 0u );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EUnspecified );
}

TEST_F( DeckLinkDevice, WithoutAReceiverOrAnAllocatorFramesAreLost )
{
  ASSERT_TRUE( m_pDevice->Initialise().Succeeded() );
  ASSERT_TRUE( m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, 0 ).Succeeded() );
  EXPECT_TRUE( Input().DeliverFrame( {} ) );
  m_pDevice->SetDataCallback( m_pReceiver );
  EXPECT_TRUE( Input().DeliverFrame( {} ) );
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Memory allocation failed." } ) );
  m_pDevice->SetAllocator( m_pAllocator );
  EXPECT_EQ( Delivered( {} ).m_Index, 0u );

  // Held weakly
  std::weak_ptr<VFrameReceiver> pWeak = m_pReceiver;
  m_pReceiver = std::make_shared<VFrameReceiver>();
  EXPECT_TRUE( pWeak.expired() );
  EXPECT_TRUE( Input().DeliverFrame( {} ) );
  EXPECT_EQ( m_pAllocator->m_Outstanding, 0 );
}

TEST_F( DeckLinkDevice, LossOfSignalOnlyTogglesTheState )
{
  InitialiseAndCapture();
  Input().DeliverFrame( NoInput );
  EXPECT_EQ( Fired(), VFired() );

  Delivered( {} );
  EXPECT_EQ( Fired(), ( VFired{ { "standard", 1 }, { "formats", 1 } } ) );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::ESD_720_486I_5994 );

  Input().DeliverFrame( NoInput );
  EXPECT_EQ( Fired(), ( VFired{ { "standard", 1 }, { "formats", 1 } } ) );
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
  Deliver( 1000 * Period );   // the card has run for 999 frames before this one
  Deliver( 1001 * Period );
  Deliver( 1002 * Period + Period / 2 );   // late, but none is missing
  Deliver( 1006 * Period );
  m_pDevice->StopCapture();
  Input().DeliverFrame( { .m_Duration = Period, .m_HardwareTime = 1007 * Period } );   // seen, but not captured
  m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, 0 );
  Deliver( 1010 * Period );
  Deliver( 5 * Period );   // the clock began anew
  Deliver( 6 * Period );
  m_pService->RunAll();
  EXPECT_EQ( m_Dropped, ( std::vector<unsigned int>{ 999, 2, 3 } ) );
}

TEST_F( DeckLinkDevice, AFrameWithoutCardTimeCountsNothing )
{
  InitialiseAndCapture();
  Delivered( { .m_HardwareTime = 9 * 5400000, .m_Failures = { "GetHardwareReferenceTimestamp" } } );
  Delivered( { .m_Duration = 0, .m_HardwareTime = 9 * 5400000 } );
  m_pService->RunAll();
  EXPECT_TRUE( m_Dropped.empty() );
}

TEST_F( DeckLinkDevice, TheInterlacedFormatFollowsTheStandard )
{
  InitialiseAndCapture();
  EXPECT_EQ( Delivered( {} ).m_Header.m_VideoInfo.m_InterlacedFormat, KVZ::IInterlacedFormat::EInterlacedFrameUnspecifiedLineTiming );
  Input().DeliverFormat( FourCharacterCode( "Hp60" ), DetectedSignal::YCbCr422 );
  EXPECT_EQ( Delivered( {} ).m_Header.m_VideoInfo.m_InterlacedFormat, KVZ::IInterlacedFormat::ENotInterlaced );
}

}
