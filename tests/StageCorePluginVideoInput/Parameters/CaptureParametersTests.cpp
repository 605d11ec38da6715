// Where captures go, and in what form.
#include "tests/StageCorePluginVideoInput/Parameters/HandlerFixture.h"

#include "Core/VideoInterface/Schemas.h"
#include "tests/support/AssertionCapture.h"

namespace
{

using KVZ::IAudioPayload;
using KVZ::IVideoContainer;
using KVZ::IVideoPayload;
using Labels = std::vector<std::string>;
using VCaptureParameters = VHandlerFixture;

// Whose list changes while it is being read.
class VRestlessFolders : public VFakeCaptureTargets
{
public:
  void GetFolderAliases( std::vector<std::string>& o_rAliases ) override
  {
    VFakeCaptureTargets::GetFolderAliases( o_rAliases );
    if( !std::exchange( m_bChanged, true ) )
    {
      SetAliases( { "Other" } );
    }
  }

private:
  bool m_bChanged = false;
};

}

TEST_F( VCaptureParameters, AnUnknownKeyIsAnAssertion )
{
  Create();
  TestSupport::VAssertionCapture Assertions;
  EXPECT_FALSE( m_pHandler->GetParameter( "Nothing" ) );
  EXPECT_EQ( Assertions.Expressions(), Labels{ "pParameter" } );
}

TEST_F( VCaptureParameters, PayloadsFollowTheContainer )
{
  Create();
  EXPECT_EQ( Value<IVideoContainer::Enum>( "VideoContainer" ), IVideoContainer::ETVID );
  EXPECT_EQ( LabelsOf( "VideoContainer" ), ( Labels{ "MOV", "MP4", "AVI", "TVID", "MKV", "IMAGES" } ) );
  EXPECT_EQ( LabelsOf( "VideoPayload" ), Labels{ "Uncompressed" } );
  EXPECT_EQ( LabelsOf( "AudioPayload" ), ( Labels{ "None", "Uncompressed" } ) );
  EXPECT_FALSE( Set( "VideoPayload", IVideoPayload::EImageJPEG ) );

  Set( "VideoContainer", IVideoContainer::EIMAGES );
  EXPECT_EQ( LabelsOf( "VideoPayload" ), ( Labels{ "ImageJPEG", "ImagePNG", "ImageTIFF" } ) );
  EXPECT_EQ( Value<IVideoPayload::Enum>( "VideoPayload" ), IVideoPayload::EImageJPEG );
  EXPECT_EQ( Value<IAudioPayload::Enum>( "AudioPayload" ), IAudioPayload::ENone );

  Set( "VideoContainer", IVideoContainer::EMOV );
  EXPECT_EQ( Value<IVideoPayload::Enum>( "VideoPayload" ), IVideoPayload::EImageJPEG ) << "still allowed, so it stays";
}

TEST_F( VCaptureParameters, OnlyContainersThatCanBeWrittenAreOffered )
{
  Save( DeviceSchemas::VideoContainer( m_Device ), IVideoContainer::EMKV );
  Create( { IVideoContainer::EMOV, IVideoContainer::EAVI } );
  EXPECT_EQ( LabelsOf( "VideoContainer" ), ( Labels{ "MOV", "AVI" } ) );
  EXPECT_EQ( Value<IVideoContainer::Enum>( "VideoContainer" ), IVideoContainer::EMOV );
  EXPECT_FALSE( Set( "VideoContainer", IVideoContainer::ETVID ) );
}

TEST_F( VCaptureParameters, AFolderThatHasGoneGivesWayToTheDefaultOne )
{
  const std::string Message = "Device vi:0 is using an invalid capture folder [ Fast Disk ], reverting to default capture folder.";
  TestSupport::VLogCapture Log( "Capture" );
  Save( DeviceSchemas::CaptureDirectory( m_Device ), std::string( "Fast Disk" ) );
  Create();
  EXPECT_EQ( Value<std::string>( "CaptureDirectory" ), "Fast Disk" );
  EXPECT_EQ( LabelsOf( "CaptureDirectory" ), ( Labels{ "None", "Default", "Fast Disk" } ) );
  EXPECT_TRUE( Set( "CaptureDirectory", std::string( "None" ) ) );
  EXPECT_TRUE( Set( "CaptureDirectory", std::string( "Fast Disk" ) ) );
  EXPECT_FALSE( Set( "CaptureDirectory", std::string( "Slow Disk" ) ) );

  m_pTargets->SetAliases( { "Default", "None", "Other", "Other" } );
  m_pService->RunAll();
  EXPECT_EQ( Value<std::string>( "CaptureDirectory" ), "Default" );
  EXPECT_EQ( LabelsOf( "CaptureDirectory" ), ( Labels{ "None", "Default", "Other" } ) );
  ASSERT_EQ( Log.Texts(), Labels{ Message } );
  EXPECT_EQ( Log.Lines()[0].m_Level, 3 );
}

TEST_F( VCaptureParameters, AFolderThatComesWhileTheyAreReadIsOffered )
{
  m_pTargets = std::make_shared<VRestlessFolders>();
  Create();
  EXPECT_EQ( LabelsOf( "CaptureDirectory" ), ( Labels{ "None", "Other" } ) );
}
