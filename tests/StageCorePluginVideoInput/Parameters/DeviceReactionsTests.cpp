// How a video input reacts to its device, its user and the system.
#include "tests/StageCorePluginVideoInput/Parameters/HandlerFixture.h"

#include "Core/VideoInterface/Schemas.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/DeviceStatusSchema.h"
#include "NotificationSystem/AsioPostalService.h"

#include <boost/thread/thread.hpp>

namespace
{

using EStatus = VideoInputHAL::IVideoInputDevice::EStatus;
using KVZ::IAudioSampleFormat;
using KVZ::IGenlockStandard;
using KVZ::IPixelFormat;
using KVZ::ITimecodeSource;
using KVZ::IVideoStandard;
using KVZ::Variant;
using Labels = std::vector<std::string>;
using VReactions = VHandlerFixture;
using VSettings = TestSupport::VFakeVideoInputDevice::VSettings;
namespace Keys = DeviceSchemas::VideoInput;

}

TEST_F( VReactions, EnabledStartsAndStopsTheDevice )
{
  m_pDevice->SetSignal( IVideoStandard::EHD_1920_1080P_2500 );
  Create();
  ASSERT_EQ( m_pDevice->m_Starts.size(), 1u );
  EXPECT_EQ( m_pDevice->m_Starts[0], ( VSettings{ m_pDevice->GetPixelFormat(), ITimecodeSource::EAny, IAudioSampleFormat::EInt16, 16 } ) );
  EXPECT_EQ( Value<EStatus::Enum>( "Status" ), EStatus::ECapturing );
  EXPECT_EQ( m_pSource->m_Enabled, true );

  Set( "Enabled", true );
  EXPECT_EQ( m_pDevice->m_Starts.size(), 1u );
  Set( "Enabled", false );
  EXPECT_EQ( m_pDevice->m_Stops, 1 );
  EXPECT_EQ( Value<EStatus::Enum>( "Status" ), EStatus::EReady );
  EXPECT_EQ( m_pSource->m_Enabled, false );
  Set( "Enabled", false );
  EXPECT_EQ( m_pDevice->m_Stops, 1 );
  Set( "Enabled", true );
  EXPECT_EQ( m_pDevice->m_Starts.size(), 2u );
}

TEST_F( VReactions, EnabledSettlesOnlyAfterTheDeviceHasBeenTold )
{
  Create();
  int Settled = 0;
  m_pHandler->GetParameter( "Enabled" )->GetValueChangedCallback().AddImmediate( [&] { EXPECT_EQ( m_pDevice->m_Stops, ++Settled ); } );
  VDataVerifyWriter( *m_pStore ).SetProposedValue( DeviceSchemas::Enabled( m_Device ), Variant::Make( false ) );
  EXPECT_EQ( Settled, 0 );
  EXPECT_TRUE( Value<bool>( "Enabled" ) );
  EXPECT_FALSE( VDataReader( *m_pStore ).IsSettled( DeviceSchemas::Enabled( m_Device ) ) );
  m_pService->RunAll();
  EXPECT_EQ( Settled, 1 );
  EXPECT_FALSE( Value<bool>( "Enabled" ) );
}

TEST_F( VReactions, EnabledTellsTheWishAndStatusTheFact )
{
  m_pDevice->m_bRefuseStart = true;
  Create();
  EXPECT_EQ( m_pDevice->m_Starts.size(), 1u );
  EXPECT_TRUE( Value<bool>( "Enabled" ) );
  EXPECT_TRUE( VDataReader( *m_pStore ).IsSettled( DeviceSchemas::Enabled( m_Device ) ) );
  EXPECT_EQ( Value<EStatus::Enum>( "Status" ), EStatus::EReady );
  EXPECT_FALSE( m_pHandler->StartCapture() );
  m_pDevice->m_bRefuseStart = false;
  Set( "Enabled", true );
  EXPECT_EQ( Value<EStatus::Enum>( "Status" ), EStatus::ECapturing );
}

TEST_F( VReactions, AChangedFormatRestartsAStreamingDeviceAndNoOther )
{
  Create();
  ASSERT_EQ( m_pDevice->m_Starts.size(), 1u ) << "the defaults restart nothing";
  Set( "AudioChannelCount", uint32_t{ 2 } );
  Set( "AudioSampleFormat", IAudioSampleFormat::EInt32 );
  Set( "TimecodeSource", ITimecodeSource::ERP188_LTC );
  Set( "PixelFormat", *m_pDevice->m_PixelFormats.begin() );
  ASSERT_EQ( m_pDevice->m_Starts.size(), 5u );
  EXPECT_EQ( m_pDevice->m_Starts.back(),
    ( VSettings{ *m_pDevice->m_PixelFormats.begin(), ITimecodeSource::ERP188_LTC, IAudioSampleFormat::EInt32, 2 } ) );
  Set( "AudioChannelCount", uint32_t{ 2 } );
  EXPECT_EQ( m_pDevice->m_Starts.size(), 5u ) << "the same value is no change";

  Set( "Enabled", false );
  Set( "AudioChannelCount", uint32_t{ 8 } );
  EXPECT_EQ( m_pDevice->m_Starts.size(), 5u );
  EXPECT_TRUE( m_pHandler->StartCapture() );
  EXPECT_EQ( m_pDevice->m_Starts.back().m_AudioChannels, 8u );
  EXPECT_TRUE( m_pHandler->StopCapture() );
}

TEST_F( VReactions, SettingsOfAnotherTypeStartWithFallbacksButForThePixelFormat )
{
  Create();
  Set( "Enabled", false );
  Save( Keys::TimecodeSource( m_Device ), 1.5 );
  Save( Keys::AudioSampleFormat( m_Device ), 1.5 );
  Save( Keys::AudioChannelCount( m_Device ), 1.5 );
  EXPECT_TRUE( m_pHandler->StartCapture() );
  EXPECT_EQ( m_pDevice->m_Starts.back(), ( VSettings{ m_pDevice->GetPixelFormat(), ITimecodeSource::EUnspecified, IAudioSampleFormat::Enum{}, 0 } ) );
  const size_t Starts = m_pDevice->m_Starts.size();
  Save( Keys::PixelFormat( m_Device ), 1.5 );
  EXPECT_FALSE( m_pHandler->StartCapture() );
  EXPECT_EQ( m_pDevice->m_Starts.size(), Starts );
}

TEST_F( VReactions, APixelFormatThatIsNoLongerOfferedGivesWayToTheFirst )
{
  m_pDevice->m_PixelFormats = { IPixelFormat::EU8Y8V8Y8 };
  Create();
  SetPixelFormats( { IPixelFormat::ELuminance8, IPixelFormat::ER8G8B8 } );
  const auto First = *m_pDevice->m_PixelFormats.begin();
  const Labels Expected{ ToName( First ), ToName( *m_pDevice->m_PixelFormats.rbegin() ) };
  EXPECT_EQ( LabelsOf( "PixelFormat" ), Expected );
  EXPECT_EQ( Value<IPixelFormat::Enum>( "PixelFormat" ), First );
  EXPECT_EQ( m_pDevice->m_Starts.back().m_PixelFormat, First ) << "and the device restarts with it";
  SetPixelFormats( {} );
  EXPECT_EQ( LabelsOf( "PixelFormat" ), Expected ) << "an empty list changes nothing";

  const auto Unnamed = static_cast<IPixelFormat::Enum>( 9000 );
  SetPixelFormats( { Unnamed, static_cast<IPixelFormat::Enum>( 9001 ) } );
  EXPECT_EQ( Value<IPixelFormat::Enum>( "PixelFormat" ), Unnamed ) << "also where two of the same label cannot be listed";
}

TEST_F( VReactions, TheTimecodeSourceDefaultsToTheWidestThatThereIs )
{
  using E = ITimecodeSource;
  const std::pair<std::set<E::Enum>, E::Enum> Cases[] = {
    { { E::ERP188_LTC, E::ERP188_Any, E::EAny }, E::EAny }, { { E::ERP188_LTC, E::ERP188_Any }, E::ERP188_Any },
    { { E::EVITC_Field2, E::ESerial }, E::EVITC_Field2 },
    { { E::EUnspecified, E::EAny, static_cast<E::Enum>( 9000 ) }, E::EAny },   // two of the same label: no list
  };
  for( const auto& [Sources, Default] : Cases )
  {
    VDataWriter( *m_pStore ).RemoveValue( Keys::TimecodeSource( m_Device ) );
    m_pDevice->m_TimecodeSources = Sources;
    Create();
    EXPECT_EQ( Value<E::Enum>( "TimecodeSource" ), Default );
  }
}

TEST_F( VReactions, TimecodeIsReceivedOrNotDetected )
{
  Create();
  const auto Told = [this]( const KVZ::ITimecode& i_rTimecode )
  {
    m_pDevice->SetTimecode( i_rTimecode );
    m_pService->RunAll();
    return Value<std::string>( "TimecodeStandard" );
  };
  EXPECT_EQ( Told( { KVZ::ITimecodeStandard::ETimecode25, 0, 59, 59, 24 } ), "Receiving 25 fps" );
  EXPECT_EQ( Told( { KVZ::ITimecodeStandard::ETimecode25, 0, 59, 59, 25 } ), "Not Detected" );
  EXPECT_EQ( Told( { KVZ::ITimecodeStandard::ETimecode30Drop, 0, 10, 0, 0 } ), "Receiving 29.97 fps DF" );
  EXPECT_EQ( Told( {} ), "Not Detected" );
}

TEST_F( VReactions, TheTimeOffsetIsAWholeNumberOfMasterBeats )
{
  Create();
  Set( "TimeOffsetTicks", int64_t{ 3000000 } );
  EXPECT_FALSE( m_pSource->m_Adjustment ) << "there is no master clock";
  SetMasterPeriod( 1350000 );
  EXPECT_EQ( m_pSource->m_Adjustment, 2 * 1350000 );
  Set( "TimeOffsetTicks", int64_t{ -2025000 } );
  EXPECT_EQ( m_pSource->m_Adjustment, -2 * 1350000 ) << "halves go away from zero";
  SetMasterPeriod( 2252250 );
  EXPECT_EQ( m_pSource->m_Adjustment, -2252250 );
  SetMasterPeriod( 0 );
  EXPECT_EQ( m_pSource->m_Adjustment, -2252250 );
  Set( "TimeOffsetTicks", std::numeric_limits<int64_t>::max() );
  SetMasterPeriod( 1350000 );
  EXPECT_GT( m_pSource->m_Adjustment, int64_t{ 1 } << 60 ) << "far away, and not over the end";
  VDataWriter( *m_pStore ).RemoveValue( Keys::TimeOffsetTicks( m_Device ) );
  SetMasterPeriod( 2252250 );
  EXPECT_EQ( m_pSource->m_Adjustment, 0 ) << "none is none";
}

TEST_F( VReactions, AFrameRateThatCannotLockIsToldToTheUser )
{
  const VDataPath& rGenlock = DeviceSchemas::Gn6System::GenlockStandard();
  const VDataPath& rRate = DeviceSchemas::Gn6System::FrameRateActual();
  m_pDevice->SetSignal( IVideoStandard::EHD_1920_1080P_2398 );
  Create();
  EXPECT_EQ( Warning(),
    "The system rate (0.00 Hz) is incompatible with this video input's frame rate (23.98 Hz). Disable the input, or change the "
    "system frame rate to multiple of a standard SDI base rate." );
  Save( rGenlock, IGenlockStandard::EGenlockStandardVESA60 );
  EXPECT_EQ( Warning(),
    "The genlock standard (60.00 Hz) is incompatible with this video input's frame rate (23.98 Hz).  Disable the video input, "
    "or change the genlock standard to a compatible rate." );
  Set( "Enabled", false );
  EXPECT_EQ( Warning(), "" );
  Set( "Enabled", true );
  EXPECT_NE( Warning(), "" );
  SetSignal( IVideoStandard::EUnspecified );
  EXPECT_EQ( Warning(), "" );

  Save( rGenlock, IGenlockStandard::EGenlockStandardNTSC );
  SetSignal( IVideoStandard::EHD_1920_1080P_5994 );
  EXPECT_EQ( Warning(), "" );
  Save( rGenlock, IGenlockStandard::EGenlockStandardNone );
  Save( rRate, 100.0 );
  SetSignal( IVideoStandard::EHD_1920_1080P_2500 );
  EXPECT_EQ( Warning(), "" );
  Save( rRate, 120.0 );
  EXPECT_EQ( Warning().find( "The system rate (120.00 Hz) is incompatible with this video input's frame rate (25.00 Hz)." ), 0u );
  Save( rGenlock, std::string( "PAL" ) );
  EXPECT_NE( Warning(), "" ) << "a genlock of another type counts as none";
  Save( rRate, 30.0 );
  SetSignal( IVideoStandard::EHD_2048_1556PSF_1500 );
  EXPECT_NE( Warning().find( "frame rate (0.00 Hz)" ), std::string::npos ) << "a standard without a period fits nothing";
}

TEST_F( VReactions, UsersOnOtherThreadsNeverLeaveAWishUnanswered )
{
  constexpr int Rounds = 200;
  const auto pService = std::make_shared<NotificationSystem::VAsioPostalService>( "Engine" );
  m_pHandler = KVZ::MakeShared<VVideoInputDeviceParameterHandler>( pService, m_pStore, m_pRegistry, m_pTargets, m_pSources, m_pDevice, m_pSource );
  const auto Toggle = [this]( const char* i_pKey, const Variant& i_rFirst, const Variant& i_rSecond )
  {
    const auto pParameter = m_pHandler->GetParameter( i_pKey );
    for( int Round = 0; Round < Rounds; ++Round )
    {
      EXPECT_TRUE( pParameter->SetValue( i_rFirst ) && pParameter->SetValue( i_rSecond ) );
    }
  };
  boost::thread Enabler( Toggle, "Enabled", Variant::Make( true ), Variant::Make( false ) );
  boost::thread Listener( Toggle, "AudioChannelCount", Variant::Make<uint32_t>( 2 ), Variant::Make<uint32_t>( 8 ) );
  Toggle( "UseTimecodeForSync", Variant::Make( true ), Variant::Make( false ) );
  Enabler.join();
  Listener.join();
  pService->Stop();
  EXPECT_TRUE( VDataReader( *m_pStore ).IsSettled( DeviceSchemas::Enabled( m_Device ) ) );
  EXPECT_FALSE( Value<bool>( "Enabled" ) );
  EXPECT_EQ( m_pDevice->GetStatus(), EStatus::EReady );
  EXPECT_EQ( m_pSource->m_UseTimecode, false );
}

TEST_F( VReactions, NothingReactsOnceTheHandlerHasGone )
{
  Create();
  m_pDevice->SetSignal( IVideoStandard::EHD_1920_1080P_2500 );
  VDataWriter( *m_pStore ).SetValue( DeviceSchemas::Enabled( m_Device ), Variant::Make( false ) );
  m_pHandler.reset();
  m_pService->RunAll();
  EXPECT_EQ( m_pDevice->m_Stops, 0 );
  EXPECT_TRUE( m_pRegistry->GetGroups().empty() );
  EXPECT_EQ( m_pDevice->GetVideoStandardChangedCallback().Count(), 0u );
  SetMasterPeriod( 1350000 );
  m_pDevice->SetPixelFormats( { IPixelFormat::ELuminance8 } );
  m_pTargets->SetAliases( {} );
  m_pService->RunAll();
}
