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
  const struct
  {
    const char* m_pFailure;
    VCalls m_Messages;
  } Rows[] = { { "QueryInterface", { "Could not query interface." } }, { "GetDisplayModeIterator", {} },
    { "SetCallback", { "Could not set callback." } }, { "EnableVideoInput", {} }, { "StartStreams", {} } };
  m_pCard->m_Refused = { IID_IDeckLinkInput };
  for( const auto& rRow : Rows )
  {
    SCOPED_TRACE( rRow.m_pFailure );
    m_Log.Clear();
    Input().m_Failures = { rRow.m_pFailure };
    EXPECT_EQ( MakeDevice( 2 )->Initialise().m_Code, InitialiseFailed );
    EXPECT_EQ( m_Log.Texts(), rRow.m_Messages );
    m_pCard->m_Refused = {};
  }
}

TEST_F( DeckLinkDevice, MissingAttributesAreNoFailureAndTheirNewerNameIsKnown )
{
  m_pCard->m_Refused = { IID_IDeckLinkAttributes, IID_IDeckLinkProfileAttributes };
  EXPECT_TRUE( m_pDevice->Initialise().Succeeded() );

  TestSupport::VLogCapture Information( "VideoInputDeviceBlackmagic", 5 );
  m_pCard->m_Refused = {};
  m_pCard->m_AttributesId = IID_IDeckLinkProfileAttributes;
  MakeDevice( 2 )->Initialise();
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
    EXPECT_EQ( VideoInputHAL::QueryInterface<IDeckLinkInputCallback>( rCallback, rId ).get(), &rCallback );
  }
  for( const REFIID& rId : { NewerCallback, NewestCallback, IID_IDeckLinkDeviceNotificationCallback } )
  {
    EXPECT_EQ( VideoInputHAL::QueryInterface<IUnknown>( rCallback, rId ), nullptr );
  }
}

TEST_F( DeckLinkDevice, StartCaptureStopsEnablesAndStarts )
{
  const struct
  {
    KVZ::IAudioSampleFormat::Enum m_AudioFormat;
    uint32_t m_Channels;
    VCalls m_AudioCalls;
  } Rows[] = {
    { Int16, 0, {} },
    { Int16, 2, { "EnableAudioInput 48000 16 2" } },
    { KVZ::IAudioSampleFormat::EInt32, 16, { "EnableAudioInput 48000 32 16" } },
    { KVZ::IAudioSampleFormat::EFloat32, 8, { "EnableAudioInput 48000 16 8" } },
  };
  Initialise();
  for( const auto& rRow : Rows )
  {
    Input().ForgetCalls();
    EXPECT_EQ( m_pDevice->StartCapture( IPixelFormat::EU10Y10V10Y10, AnyTimecode, rRow.m_AudioFormat, rRow.m_Channels ).m_Code, 0 );
    VCalls Expected{ "StopStreams", "EnableVideoInput ntsc v210 1" };
    Expected.insert( Expected.end(), rRow.m_AudioCalls.begin(), rRow.m_AudioCalls.end() );
    Expected.push_back( "StartStreams" );
    EXPECT_EQ( Input().Calls(), Expected );
    EXPECT_EQ( Fired(), ( VFired{ { "status", 1 } } ) );
  }
  EXPECT_EQ( m_pDevice->GetPixelFormat(), IPixelFormat::EU10Y10V10Y10 );
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::ECapturing );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

// A restart that fails ends a capture that ran.
TEST_F( DeckLinkDevice, EachStepOfStartCaptureThatFailsIsNamedAndLeavesCaptureOff )
{
  const struct
  {
    const char* m_pFailure;
    int32_t m_Code;
    VCalls m_Messages;
    IPixelFormat::Enum m_PixelFormat = UYVY;
  } Rows[] = {
    { "EnableVideoInput", StartFailed, { "Unable to select the chosen video mode for capture.  Perhaps the selected device is in use." } },
    { "EnableAudioInput", StartFailed, { "Unable to select the chosen audio mode for capture.  Perhaps the selected device is in use." } },
    { "StartStreams", StartFailed, { "Unable to start the capture. Perhaps the selected device is in use." } },
    { "a format that no card delivers", StartFailed,
      { "Unsupported pixel format.", "Unable to select the chosen video mode for capture.  Perhaps the selected device is in use." },
      IPixelFormat::ER8G8B8 },
    { "a mode that the card did not list", ModeNotFound, { "Could not find requested mode." } },
  };
  Initialise();
  for( const auto& rRow : Rows )
  {
    SCOPED_TRACE( rRow.m_pFailure );
    Input().m_Failures = {};
    Capture( 2 );
    if( rRow.m_Code == ModeNotFound )
    {
      DeliverFormat( FourCharacterCode( "4k25" ) );
    }
    m_Log.Clear();
    Input().m_Failures = { rRow.m_pFailure };
    EXPECT_EQ( m_pDevice->StartCapture( rRow.m_PixelFormat, AnyTimecode, Int16, 2 ).m_Code, rRow.m_Code );
    EXPECT_EQ( m_Log.Texts(), rRow.m_Messages );
    EXPECT_EQ( m_Log.Lines()[0].m_Level, 2 );
    EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::EReady );
    EXPECT_EQ( m_pDevice->GetPixelFormat(), UYVY );
  }
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
  DeliverFormat( FourCharacterCode( "Hp60" ) );
  EXPECT_EQ( Input().Calls(), ( VCalls{ "PauseStreams", "EnableVideoInput Hp60 2vuy 1", "FlushStreams", "StartStreams" } ) );
  EXPECT_EQ( Fired(), ( VFired{ { "standard", 1 }, { "formats", 1 } } ) );
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::ECapturing );

  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EUnspecified );
  Delivered( {} );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EHD_1920_1080P_6000 );
}

TEST_F( DeckLinkDevice, TheDetectedSignalDecidesThePixelFormats )
{
  const struct
  {
    uint32_t m_Detected;
    std::set<IPixelFormat::Enum> m_Formats;
  } Rows[] = {
    { DetectedSignal::YCbCr422, { UYVY, IPixelFormat::EU10Y10V10Y10 } },
    { DetectedSignal::RGB444, { IPixelFormat::EB8G8R8u8 } },
    { DetectedSignal::YCbCr422 | DetectedSignal::DualStream3D, {} },
    { 0, {} },
  };
  Initialise();
  Input().DeliverFrame( {} );
  for( const auto& rRow : Rows )
  {
    SCOPED_TRACE( rRow.m_Detected );
    Input().DeliverFormat( FourCharacterCode( "Hp25" ), rRow.m_Detected );
    EXPECT_EQ( PixelFormatsOf( *m_pDevice ), rRow.m_Formats );
  }
  DeliverFormat( DisplayModeUnknown );
  m_Log.Clear();
  EXPECT_EQ( m_pDevice->GetVideoStandard(), IVideoStandard::EUnspecified );
  EXPECT_EQ( m_Log.Texts(), ( VCalls{ "Unsupported video mode." } ) );
}

}
