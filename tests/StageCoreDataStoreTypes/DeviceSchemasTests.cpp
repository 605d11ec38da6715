#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

namespace
{

class DeviceSchemasLog : public testing::Test
{
protected:
  DeviceSchemasLog()
  {
    DeviceSchemas::SetLogClock( [this] { return m_Seconds; } );
  }
  ~DeviceSchemasLog() override { DeviceSchemas::SetLogClock( {} ); }

  double m_Seconds = 100.0;
  TestSupport::VLogCapture m_Log{ "DataStore" };
};

}

TEST( DeviceSchemas, FormPathsOfClassDeviceGroupAndKey )
{
  const VDataPath Device = DeviceSchemas::VideoInput::Path( "vi:0" );
  EXPECT_EQ( Device.ToString(), "VideoInput.vi:0" );
  EXPECT_EQ( DeviceSchemas::Enabled( Device ), ( VDataPath{ "VideoInput", "vi:0", "Settings", "Enabled" } ) );
  EXPECT_EQ( DeviceSchemas::EnabledHandle( Device ).Path(), DeviceSchemas::Enabled( Device ) );
  EXPECT_EQ( DeviceSchemas::VideoInput::TimeOffsetFrames( Device ).ToString(), "VideoInput.vi:0.Timecode.TimeOffsetFrames" );
  EXPECT_EQ( DeviceSchemas::AnalogueCard::Path( 12 ).ToString(), "AnalogueCard12" );
  EXPECT_EQ( DeviceSchemas::AnalogueCard::GenlockAndTimecode( DeviceSchemas::AnalogueCard::Path( 12, "ac:1" ) ).ToString(),
    "AnalogueCard12.ac:1.Genlock and Timecode" );
  EXPECT_EQ( DeviceSchemas::Nodes::CaptureFileNameStem().ToString(), "ApplicationSettings.Capture.FileNameStem" );

  const VDataPath All = DeviceSchemas::VideoInput::Path( "*" );
  EXPECT_TRUE( DeviceSchemas::Settings( All ).IsWildcard() );
  EXPECT_TRUE( DeviceSchemas::UserId( All ).IsWildcard() );
  EXPECT_TRUE( DeviceSchemas::UserIdHandle( All ).Path().IsEmpty() );
}

TEST_F( DeviceSchemasLog, WritesAtMostOneLineInThirtySeconds )
{
  EXPECT_EQ( DeviceSchemas::VideoInput::Path( "" ).ToString(), "VideoInput.qx:000000" );
  m_Seconds += 29.9;
  EXPECT_EQ( DeviceSchemas::DevicePath( {}, "vi:3" ).ToString(), "InvalidDeviceClass.vi:3" );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "Failed to create device schema: [VideoInput] [] (total log count = 1)" } );

  m_Log.Clear();
  m_Seconds += 0.1;
  DeviceSchemas::DevicePath( {}, "vi:3" );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "Failed to create device schema: [] [vi:3] (total log count = 3)" } );
  EXPECT_EQ( m_Log.Lines()[0].m_Level, 2 );
}
