// What a video input publishes when it appears, and what it keeps of saved settings.
#include "tests/StageCorePluginVideoInput/Parameters/HandlerFixture.h"

#include "Core/VideoInterface/Schemas.h"
#include "StageCoreDataStoreTypes/MaskGrid.h"

namespace
{

using KVZ::IPixelFormat;
using KVZ::IVideoStandard;
using KVZ::Variant;
using Labels = std::vector<std::string>;
using VParameters = VHandlerFixture;
namespace Keys = DeviceSchemas::VideoInput;

}

TEST_F( VParameters, TellWhatTheDeviceIsInTheirOrder )
{
  Create();
  ASSERT_EQ( m_pRegistry->GetGroups().size(), 1u );
  std::string Names;
  for( const auto& pParameter : m_pRegistry->GetGroups()[0]->GetParameters() )
  {
    Names += pParameter->GetName() + " ";
  }
  EXPECT_EQ( Names,
    "DisplayType Connected ConnectionCount Enabled Name CaptureDirectory VideoContainer VideoPayload AudioPayload ProcessInRealtime UserId "
    "DriverName DeviceName Status VideoStandard TimecodeStandard PixelFormat AudioChannelCount AudioSampleFormat AudioSampleRate TimecodeSource "
    "TimeOffsetTicks UseTimecodeForSync PixelAspectRatio GreyscaleMode Threshold CircularityThreshold MaximumBlobHeight " );
  EXPECT_EQ( Value<std::string>( "DriverName" ), "Test Maker" );
  EXPECT_EQ( Value<std::string>( "DeviceName" ), "Test Card (1)" );
  EXPECT_EQ( Value<std::string>( "DisplayType" ), "TestDriver" );
  EXPECT_EQ( LabelsOf( "Status" ), ( Labels{ "Ready", "Streaming", "Unavailable" } ) );
  EXPECT_EQ( LabelsOf( "VideoStandard" ).size(), 61u );
  EXPECT_EQ( LabelsOf( "AudioChannelCount" ), ( Labels{ "2", "8", "16" } ) );
  EXPECT_EQ( Value<uint32_t>( "AudioChannelCount" ), 16u );
  EXPECT_EQ( LabelsOf( "AudioSampleRate" ), Labels{ "48000 Hz" } );
  EXPECT_EQ( LabelsOf( "GreyscaleMode" ), ( Labels{ "Auto", "None", "Only", "Edges", "NoEdges" } ) );
  EXPECT_EQ( Value<double>( "Threshold" ), 0.6 );
  EXPECT_TRUE( m_pHandler->GetParameter( "Status" )->IsReadOnly() );
  EXPECT_TRUE( m_pHandler->GetParameter( "PixelAspectRatio" )->IsHidden() );
  EXPECT_EQ( m_pHandler->GetParameter( "TimeOffsetTicks" )->GetDataConversionHint(), Parameter::DataConversionHint::EMillisecondsToTick135 );

  // Without a signal nothing is connected, and the source stays out.
  EXPECT_FALSE( Value<bool>( "Connected" ) );
  EXPECT_EQ( Value<uint32_t>( "ConnectionCount" ), 1u );
  EXPECT_TRUE( Value<bool>( "Enabled" ) );
  EXPECT_EQ( m_pSource->m_Enabled, false );
  EXPECT_EQ( m_pSource->m_Ratio, 1.0 );
  EXPECT_FALSE( VDataReader( *m_pStore ).Exists( DeviceSchemas::MaskGrid( m_Device ) ) );
  EXPECT_EQ( Value<std::string>( "TimecodeStandard" ), "Not Detected" );
}

TEST_F( VParameters, TheFirstAppearanceCountsOnceWithASignalToo )
{
  m_pDevice->SetSignal( IVideoStandard::EHD_1920_1080P_2500 );
  Create();
  EXPECT_TRUE( Value<bool>( "Connected" ) );
  EXPECT_EQ( Value<uint32_t>( "ConnectionCount" ), 1u );
  SetSignal( IVideoStandard::EHD_1920_1080P_3000 );
  EXPECT_EQ( Value<uint32_t>( "ConnectionCount" ), 1u );
  SetSignal( IVideoStandard::EUnspecified );
  EXPECT_FALSE( Value<bool>( "Connected" ) );
  SetSignal( IVideoStandard::EHD_1920_1080P_2500 );
  EXPECT_EQ( Value<uint32_t>( "ConnectionCount" ), 2u );
}

TEST_F( VParameters, SavedSettingsSurviveAndAreApplied )
{
  m_pDevice->SetSignal( IVideoStandard::EHD_1920_1080P_2500 );
  SetMasterPeriod( 1350000 );
  Save( DeviceSchemas::Enabled( m_Device ), false );
  Save( DeviceSchemas::UserId( m_Device ), uint32_t{ 42 } );
  Save( Keys::PixelFormat( m_Device ), IPixelFormat::EU8Y8V8Y8 );
  Save( Keys::UseTimecodeForSync( m_Device ), false );
  Save( Keys::TimeOffsetTicks( m_Device ), int64_t{ 2700000 } );
  Save( Keys::PixelAspectRatio( m_Device ), 16.0 / 11.0 );
  Create();
  EXPECT_FALSE( Value<bool>( "Enabled" ) );
  EXPECT_TRUE( m_pDevice->m_Starts.empty() );
  EXPECT_EQ( Value<uint32_t>( "UserId" ), 42u );
  EXPECT_EQ( Value<IPixelFormat::Enum>( "PixelFormat" ), IPixelFormat::EU8Y8V8Y8 );
  EXPECT_EQ( m_pSource->m_Enabled, false );
  EXPECT_EQ( m_pSource->m_UseTimecode, false );
  EXPECT_EQ( m_pSource->m_Adjustment, 2700000 );
  EXPECT_EQ( m_pSource->m_Ratio, 16.0 / 11.0 );
}

TEST_F( VParameters, ASavedValueOfAnotherTypeCountsAsAbsent )
{
  Save( DeviceSchemas::UserId( m_Device ), std::string( "seven" ) );
  Save( DeviceSchemas::Enabled( m_Device ), std::string( "yes" ) );
  Create();
  EXPECT_EQ( Value<uint32_t>( "UserId" ), 1u );
  EXPECT_TRUE( Value<bool>( "Enabled" ) ) << "the default";
  EXPECT_EQ( m_pDevice->m_Starts.size(), 1u );
}

TEST_F( VParameters, ASavedEnabledThatIsOnlyVerifiedIsTheWishToo )
{
  VDataVerifyWriter( *m_pStore ).SetVerifiedValue( DeviceSchemas::Enabled( m_Device ), Variant::Make( true ) );
  Create();
  EXPECT_TRUE( Value<bool>( "Enabled" ) );
  EXPECT_EQ( m_pDevice->m_Starts.size(), 1u );
}

TEST_F( VParameters, UserIdIsTheSmallestThatNoOtherVideoInputHas )
{
  Save( DeviceSchemas::UserId( Keys::Path( "vi:5" ) ), uint32_t{ 1 } );
  Save( DeviceSchemas::UserId( Keys::Path( "vi:6" ) ), uint32_t{ 3 } );
  Save( DeviceSchemas::UserId( DeviceSchemas::Camera::Path( "cam" ) ), uint32_t{ 2 } );
  Save( DeviceSchemas::UserId( m_Device ), uint32_t{ 0xFFFFFFFF } );
  Create();
  EXPECT_EQ( Value<uint32_t>( "UserId" ), 2u );
}

TEST_F( VParameters, AMaskSurvivesUntilTheImagesSizeChanges )
{
  const VDataPath Path = DeviceSchemas::MaskGrid( m_Device );
  const auto Stored = [&]
  {
    VMaskGrid Grid;
    EXPECT_TRUE( GetTyped( VDataReader( *m_pStore ), Path, Grid ) );
    return Grid;
  };
  Create();
  SetSignal( IVideoStandard::EHD_1920_1080P_2500 );
  EXPECT_EQ( Stored(), ( VMaskGrid{ "vi:0", 4, 4, 480, 270, {} } ) );
  const VMaskGrid Drawn{ "vi:0", 4, 4, 480, 270, { 5, 6, 7 } };
  Save( Path, Drawn );
  for( const auto Standard : { IVideoStandard::EHD_1920_1080I_5994, IVideoStandard::EUnspecified, IVideoStandard::EHD_1920_1080PSF_2400 } )
  {
    SetSignal( Standard );
    EXPECT_EQ( Stored(), Drawn );
  }
  SetSignal( IVideoStandard::ESD_720_486I_5994 );
  EXPECT_EQ( Stored(), ( VMaskGrid{ "vi:0", 4, 4, 180, 122, {} } ) );
}

TEST_F( VParameters, ThePixelAspectRatioIsOneOfFive )
{
  Create();
  VParameterChoices Choices;
  ASSERT_TRUE( m_pHandler->GetParameter( "PixelAspectRatio" )->GetEnum( Choices ) );
  ASSERT_EQ( Choices.size(), 5u );
  EXPECT_EQ( Choices[1].m_Label, "SD PAL 4:3 (59:54)" );
  EXPECT_EQ( Choices[1].m_Value, Variant::Make( 1.0909090909090908 ) );
  EXPECT_FALSE( Set( "PixelAspectRatio", 59.0 / 54.0 ) );
  EXPECT_TRUE( Set( "PixelAspectRatio", 40.0 / 33.0 ) );
  EXPECT_EQ( m_pSource->m_Ratio, 40.0 / 33.0 );
}

TEST_F( VParameters, DeviceControlsExistWhereTheDeviceHasThem )
{
  m_pDevice->m_Controls["Exposure"] = { 10, 20000, 500, true };
  m_pDevice->m_Controls["Gamma"] = { 0, 4, 3, true };
  m_pDevice->m_Controls["AutoWhiteBalance"] = { 0, 0, 0, true };
  Save( Keys::Gamma( m_Device ), 2.0 );
  Create();
  EXPECT_FALSE( m_pRegistry->GetGroups()[0]->GetParameter( "Gain" ) );
  EXPECT_EQ( Value<double>( "Exposure" ), 500.0 );
  EXPECT_EQ( m_pDevice->m_ControlWrites, ( std::vector<std::pair<std::string, int32_t>>{ { "Gamma", 2 } } ) );
  Variant Default;
  m_pHandler->GetParameter( "Gamma" )->GetValueDefault( Default );
  EXPECT_EQ( Default, Variant::Make( 1.0 ) );

  m_pDevice->m_ControlWrites.clear();
  EXPECT_FALSE( Set( "Exposure", 9.0 ) );
  EXPECT_TRUE( Set( "Exposure", 19999.6 ) );
  EXPECT_TRUE( Set( "AutoWhiteBalance", false ) );
  EXPECT_EQ( m_pDevice->m_ControlWrites, ( std::vector<std::pair<std::string, int32_t>>{ { "Exposure", 20000 }, { "AutoWhiteBalance", 0 } } ) );

  m_pDevice->m_ControlWrites.clear();
  Save( Keys::Exposure( m_Device ), std::string( "long" ) );
  Save( Keys::Gamma( m_Device ), std::string( "soft" ) );
  EXPECT_EQ( m_pDevice->m_ControlWrites, ( std::vector<std::pair<std::string, int32_t>>{ { "Exposure", 500 }, { "Gamma", 1 } } ) );
}
