#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/DeckLinkFixture.h"

#include <set>

namespace
{

using namespace DeckLinkAPI;
using KVZ::IPixelFormat;
using KVZ::IVideoStandard;

constexpr int32_t InitialiseFailed = static_cast<int32_t>( 0x80000000u );
constexpr int32_t ModeNotFound = static_cast<int32_t>( 0x8000001Cu );
constexpr int32_t StartFailed = static_cast<int32_t>( 0x80000007u );

std::set<IPixelFormat::Enum> PixelFormatsOf( const VideoInputHAL::IVideoInputDevice& i_rDevice )
{
  std::set<IPixelFormat::Enum> Formats{ IPixelFormat::ER5G6B5 };
  i_rDevice.GetSupportedPixelFormats( Formats );
  return Formats;
}

TEST_F( DeckLinkDevice, StreamsWithFormatDetectionFromTheMomentItIsFound )
{
  Initialise();
  EXPECT_EQ( Input().Calls(), ( VCalls{ "EnableVideoInput ntsc 2vuy 1", "StartStreams" } ) );
  EXPECT_TRUE( Input().IsRunning() );
  EXPECT_EQ( m_pDevice->GetDeviceName(), "DeckLink C1" );
  EXPECT_EQ( m_pDevice->GetDeviceURN(), "vi:7" );
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::EReady );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EUnspecified );
  EXPECT_EQ( PixelFormatsOf( *m_pDevice ), ( std::set<IPixelFormat::Enum>{ UYVY, IPixelFormat::EU10Y10V10Y10, IPixelFormat::EB8G8R8u8 } ) );
}

TEST_F( DeckLinkDevice, EachStepOfInitialisationThatFailsEndsIt )
{
  struct VRow
  {
    const char* m_pFailure;
    const char* m_pMessage;
  };
  const VRow Rows[] = { { "GetDisplayModeIterator", nullptr }, { "SetCallback", "Could not set callback." }, { "EnableVideoInput", nullptr },
    { "StartStreams", nullptr } };
  for( const VRow& rRow : Rows )
  {
    SCOPED_TRACE( rRow.m_pFailure );
    m_Log.Clear();
    Input().m_Failures = { rRow.m_pFailure };
    const auto pDevice = KVZ::MakeShared<VDevice>( m_pCard, 2, m_pService );
    EXPECT_EQ( pDevice->Initialise().m_Code, InitialiseFailed );
    EXPECT_EQ( m_Log.Texts(), rRow.m_pMessage ? VCalls{ rRow.m_pMessage } : VCalls{} );
  }
}

TEST_F( DeckLinkDevice, ACardWithoutTheInputInterfaceIsOfNoUse )
{
  m_pCard->m_Refused = { IID_IDeckLinkInput };
  EXPECT_EQ( m_pDevice->Initialise().m_Code, InitialiseFailed );
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Could not query interface." } ) );
  EXPECT_EQ( m_Log.Lines()[0].m_Level, 2 );
}

TEST_F( DeckLinkDevice, MissingAttributesAreNoFailureAndTheirNewerNameIsKnown )
{
  m_pCard->m_Refused = { IID_IDeckLinkAttributes, IID_IDeckLinkProfileAttributes };
  EXPECT_TRUE( m_pDevice->Initialise().Succeeded() );

  TestSupport::VLogCapture Information( "VideoInputDeviceBlackmagic", 5 );
  const auto pNewer = KVZ::MakeShared<VDevice>( m_pCard, 2, m_pService );
  m_pCard->m_Refused = {};
  m_pCard->m_AttributesId = IID_IDeckLinkProfileAttributes;
  pNewer->Initialise();
  EXPECT_FALSE( Information.Has( "DeckLink C2 does not detect the format of its input." ) );
}

TEST_F( DeckLinkDevice, AnswersTheVendorForItsOwnCallbackInterfaceAlone )
{
  // From the 11.6 and 14.3 generations
  constexpr REFIID NewerCallback{ { 0xC6, 0xFC, 0xE4, 0xC9, 0xC4, 0xE4, 0x40, 0x47, 0x82, 0xFB, 0x5D, 0x23, 0x82, 0x32, 0xA9, 0x02 } };
  constexpr REFIID NewestCallback{ { 0x3A, 0x94, 0xF0, 0x75, 0xC3, 0x7D, 0x4B, 0xA8, 0xBC, 0xC0, 0x1D, 0x77, 0x8C, 0x8F, 0x88, 0x1B } };
  Initialise();
  auto& rCallback = *Input().Callback();
  for( const REFIID& rId : { IID_IUnknown, IID_IDeckLinkInputCallback } )
  {
    void* pInterface = nullptr;
    EXPECT_EQ( rCallback.QueryInterface( rId, &pInterface ), S_OK );
    EXPECT_EQ( pInterface, &rCallback );
    rCallback.Release();
  }
  for( const REFIID& rId : { NewerCallback, NewestCallback, IID_IDeckLinkDeviceNotificationCallback } )
  {
    void* pInterface = &rCallback;
    EXPECT_EQ( rCallback.QueryInterface( rId, &pInterface ), E_NOINTERFACE );
    EXPECT_EQ( pInterface, nullptr );
  }
  EXPECT_EQ( rCallback.QueryInterface( IID_IUnknown, nullptr ), E_POINTER );
}

TEST_F( DeckLinkDevice, StartCaptureStopsEnablesAndStarts )
{
  struct VRow
  {
    KVZ::IAudioSampleFormat::Enum m_AudioFormat;
    uint32_t m_Channels;
    VCalls m_Calls;
  };
  const VRow Rows[] = {
    { Int16, 0, { "StopStreams", "EnableVideoInput ntsc v210 1", "StartStreams" } },
    { Int16, 2, { "StopStreams", "EnableVideoInput ntsc v210 1", "EnableAudioInput 48000 16 2", "StartStreams" } },
    { KVZ::IAudioSampleFormat::EInt32, 16, { "StopStreams", "EnableVideoInput ntsc v210 1", "EnableAudioInput 48000 32 16", "StartStreams" } },
    { KVZ::IAudioSampleFormat::EFloat32, 8, { "StopStreams", "EnableVideoInput ntsc v210 1", "EnableAudioInput 48000 16 8", "StartStreams" } },
  };
  Initialise();
  for( const VRow& rRow : Rows )
  {
    Input().ForgetCalls();
    EXPECT_EQ( m_pDevice->StartCapture( IPixelFormat::EU10Y10V10Y10, AnyTimecode, rRow.m_AudioFormat, rRow.m_Channels ).m_Code, 0 );
    EXPECT_EQ( Input().Calls(), rRow.m_Calls );
    EXPECT_EQ( Fired(), ( VFired{ { "status", 1 } } ) );
  }
  EXPECT_EQ( m_pDevice->GetPixelFormat(), IPixelFormat::EU10Y10V10Y10 );
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::ECapturing );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( DeckLinkDevice, EachStepOfStartCaptureThatFailsIsNamedAndLeavesCaptureOff )
{
  struct VRow
  {
    const char* m_pFailure;
    int32_t m_Code;
    const char* m_pMessage;
  };
  const VRow Rows[] = {
    { "EnableVideoInput", StartFailed, "Unable to select the chosen video mode for capture.  Perhaps the selected device is in use." },
    { "EnableAudioInput", StartFailed, "Unable to select the chosen audio mode for capture.  Perhaps the selected device is in use." },
    { "StartStreams", StartFailed, "Unable to start the capture. Perhaps the selected device is in use." },
  };
  for( const VRow& rRow : Rows )
  {
    SCOPED_TRACE( rRow.m_pFailure );
    m_Log.Clear();
    Input().m_Failures = {};
    const auto pDevice = KVZ::MakeShared<VDevice>( m_pCard, 2, m_pService );
    ASSERT_TRUE( pDevice->Initialise().Succeeded() );
    // A restart that fails ends a capture that ran.
    ASSERT_TRUE( pDevice->StartCapture( UYVY, AnyTimecode, Int16, 2 ).Succeeded() );
    Input().m_Failures = { rRow.m_pFailure };
    EXPECT_EQ( pDevice->StartCapture( UYVY, AnyTimecode, Int16, 2 ).m_Code, rRow.m_Code );
    EXPECT_EQ( m_Log.Texts(), VCalls{ rRow.m_pMessage } );
    EXPECT_EQ( m_Log.Lines()[0].m_Level, 2 );
    EXPECT_EQ( pDevice->GetStatus(), VDevice::EStatus::EReady );
  }
}

TEST_F( DeckLinkDevice, StartCaptureNeedsAModeThatTheCardListed )
{
  Input().m_ModeCodes = { FourCharacterCode( "ntsc" ), FourCharacterCode( "Hp25" ) };
  Initialise();
  Input().DeliverFormat( FourCharacterCode( "Hp60" ), DetectedSignal::YCbCr422 );
  EXPECT_EQ( m_pDevice->StartCapture( UYVY, AnyTimecode, Int16, 0 ).m_Code, ModeNotFound );
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Could not find requested mode." } ) );
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::EReady );
}

TEST_F( DeckLinkDevice, APixelFormatThatNoCardDeliversIsRefused )
{
  Initialise();
  EXPECT_EQ( m_pDevice->StartCapture( IPixelFormat::ER8G8B8, AnyTimecode, Int16, 0 ).m_Code, StartFailed );
  EXPECT_TRUE( m_Log.Has( "Unsupported pixel format." ) );
  EXPECT_EQ( m_pDevice->GetPixelFormat(), UYVY );
}

TEST_F( DeckLinkDevice, StopCaptureLeavesTheCardStreaming )
{
  InitialiseAndCapture();
  EXPECT_TRUE( m_pDevice->StopCapture() );
  EXPECT_EQ( Fired(), ( VFired{ { "status", 1 } } ) );
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::EReady );
  EXPECT_TRUE( Input().Calls().empty() );
  EXPECT_TRUE( Input().DeliverFrame( {} ) );
  EXPECT_EQ( m_pReceiver->Count(), 0u );
}

TEST_F( DeckLinkDevice, AChangeOfFormatRestartsTheStreamsInTheNewMode )
{
  InitialiseAndCapture();
  Input().DeliverFormat( FourCharacterCode( "Hp60" ), DetectedSignal::YCbCr422 );
  EXPECT_EQ( Input().Calls(), ( VCalls{ "PauseStreams", "EnableVideoInput Hp60 2vuy 1", "FlushStreams", "StartStreams" } ) );
  EXPECT_EQ( Fired(), ( VFired{ { "standard", 1 }, { "formats", 1 } } ) );
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::ECapturing );

  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EUnspecified );
  Delivered( {} );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EHD_1920_1080P_6000 );
}

TEST_F( DeckLinkDevice, TheDetectedSignalDecidesThePixelFormats )
{
  struct VRow
  {
    uint32_t m_Detected;
    std::set<IPixelFormat::Enum> m_Formats;
  };
  const VRow Rows[] = {
    { DetectedSignal::YCbCr422, { UYVY, IPixelFormat::EU10Y10V10Y10 } },
    { DetectedSignal::RGB444, { IPixelFormat::EB8G8R8u8 } },
    { DetectedSignal::YCbCr422 | DetectedSignal::DualStream3D, {} },
    { 0, {} },
  };
  Initialise();
  Input().DeliverFrame( {} );
  for( const VRow& rRow : Rows )
  {
    SCOPED_TRACE( rRow.m_Detected );
    Input().DeliverFormat( FourCharacterCode( "Hp25" ), rRow.m_Detected );
    EXPECT_EQ( PixelFormatsOf( *m_pDevice ), rRow.m_Formats );
  }
}

TEST_F( DeckLinkDevice, AnUnknownModeIsReportedAndHasNoStandard )
{
  Initialise();
  Input().DeliverFrame( {} );
  Input().DeliverFormat( DisplayModeUnknown, DetectedSignal::YCbCr422 );
  m_Log.Clear();
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EUnspecified );
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Unsupported video mode." } ) );
}

}
