// The shape of the device tree: which classes exist, how a device's path is formed, under which group each key lies. No values here.
//
//   DeviceSchemas::Enabled( DeviceSchemas::VideoInput::Path( "vi:0" ) )     VideoInput.vi:0.Settings.Enabled
//
// A path function keeps the wildcard of its input. Nothing throws; any thread may call any function.
#pragma once

#include "StageCoreDataStoreTypes/DataPath.h"

#include <functional>
#include <string>

// A group segment: Group( devicePath ).
#define STAGECORE_GROUP( Name, Text ) \
  inline VDataPath Name( const VDataPath& i_rDevicePath ) { return i_rDevicePath + std::string_view( Text ); }

// A key's text alone: KKey().
#define STAGECORE_KEY_TEXT( Name )            \
  inline const std::string& Name##Key()       \
  {                                           \
    static const std::string s_Text( #Name ); \
    return s_Text;                            \
  }

// A key in a group: KKey(), K( devicePath ) and KHandle( devicePath ).
#define STAGECORE_KEY( Group, Name )                                                                            \
  STAGECORE_KEY_TEXT( Name )                                                                                    \
  inline VDataPath Name( const VDataPath& i_rDevicePath ) { return Group( i_rDevicePath ).Add( Name##Key() ); } \
  inline VDataPathHandle Name##Handle( const VDataPath& i_rDevicePath ) { return VDataPathHandle( Name( i_rDevicePath ) ); }

// A device class: Path() and Path( deviceURN ).
#define STAGECORE_CLASS( Text )            \
  inline const VDataPath& Path()           \
  {                                        \
    static const VDataPath s_Path{ Text }; \
    return s_Path;                         \
  }                                        \
  inline VDataPath Path( const std::string& i_rDeviceURN ) { return DevicePath( Path(), i_rDeviceURN ); }

// A node outside the device tree: Name() gives its path.
#define STAGECORE_NODE( Name, ... )               \
  inline const VDataPath& Name()                  \
  {                                               \
    static const VDataPath s_Path{ __VA_ARGS__ }; \
    return s_Path;                                \
  }

// A segment's text: NameSegment().
#define STAGECORE_SEGMENT( Name )             \
  inline const std::string& Name##Segment()   \
  {                                           \
    static const std::string s_Text( #Name ); \
    return s_Text;                            \
  }

namespace DeviceSchemas
{

// The path of a device of a class. An empty class or URN gets a stand-in that no device has, and leaves a line in the log, at most one in
// 30 seconds.
VDataPath DevicePath( const VDataPath& i_rClassPath, const std::string& i_rDeviceURN );

// Replaces the clock (seconds) by which those lines are spaced, and begins anew with spacing and count; an empty function restores the
// monotonic clock. For tests, while no other thread makes paths.
void SetLogClock( std::function<double()> i_Clock );

STAGECORE_GROUP( General, "General" )
STAGECORE_GROUP( Firmware, "Firmware" )
STAGECORE_GROUP( Hardware, "Hardware" )
STAGECORE_GROUP( Timecode, "Timecode" )
STAGECORE_GROUP( Network, "Network" )
STAGECORE_GROUP( Settings, "Settings" )
STAGECORE_GROUP( Warnings, "Warnings" )
STAGECORE_GROUP( Calibration, "Calibration" )
STAGECORE_GROUP( MaskGrid, "MaskGrid" )

STAGECORE_KEY( Settings, CaptureDirectory )
STAGECORE_KEY( Settings, Connected )
STAGECORE_KEY( Settings, ConnectionCount )
STAGECORE_KEY( Settings, Enabled )
STAGECORE_KEY( Settings, FirmwareVersion )
STAGECORE_KEY( Settings, GreyscaleMode )
STAGECORE_KEY( Settings, Threshold )
STAGECORE_KEY( Settings, CircularityThreshold )
STAGECORE_KEY( Settings, MaximumBlobHeight )
STAGECORE_KEY( Settings, Name )
STAGECORE_KEY( Settings, ProcessInRealtime )
STAGECORE_KEY( Settings, UserId )
STAGECORE_KEY( Settings, VideoContainer )
STAGECORE_KEY( Settings, VideoPayload )
STAGECORE_KEY( Settings, AudioPayload )
STAGECORE_KEY( Settings, RadioEnabled )
STAGECORE_KEY( Settings, RadioChannel )
STAGECORE_KEY( Settings, RadioConnectionsEnabled )
STAGECORE_KEY( Settings, RadioPairingEnabled )
STAGECORE_KEY( Settings, RadioScanEnabled )
STAGECORE_KEY( Settings, RadioSpoofingEnabled )
STAGECORE_KEY( Settings, RadioSpoofingMasterDeviceId )
STAGECORE_KEY( Settings, RadioSpoofingPanId )
STAGECORE_KEY( Settings, RadioWhitelistEnabled )
STAGECORE_KEY( Settings, RadioWhitelistSerialNumbers )
STAGECORE_KEY( Settings, StatusLightsEnabled )
STAGECORE_KEY( Hardware, DisplayType )
STAGECORE_KEY( Hardware, Type )
STAGECORE_KEY( Hardware, RadioMasterId )
STAGECORE_KEY( Hardware, RadioPanId )
STAGECORE_KEY( Hardware, SerialNumber )
STAGECORE_KEY_TEXT( RadioConflictWarning )

// Keys of any wireless device
STAGECORE_KEY( General, BatteryCharge )
STAGECORE_KEY( General, HasPendingCommands )
STAGECORE_KEY( General, LastCommandSuccessful )
STAGECORE_KEY( General, PairingMasterDeviceId )
STAGECORE_KEY( General, PairingPanId )
STAGECORE_KEY( General, PairingChannel )
STAGECORE_KEY( Warnings, BatteryRechargingNotification )
STAGECORE_KEY( Warnings, BatteryCriticalWarning )
STAGECORE_KEY( Warnings, BatteryLowWarning )

namespace Host
{
STAGECORE_CLASS( "Host" )
STAGECORE_KEY( Settings, Master )
STAGECORE_KEY( Settings, FirmwareVersion )
}

// The class segment carries the card's number: AnalogueCard12.
namespace AnalogueCard
{
VDataPath Path( unsigned int i_Card );
VDataPath Path( unsigned int i_Card, const std::string& i_rDeviceURN );
STAGECORE_GROUP( GenlockAndTimecode, "Genlock and Timecode" )
STAGECORE_KEY( Settings, ContributingTimecode )
STAGECORE_KEY( Settings, ContributingAnalogue )
}

namespace Camera
{
STAGECORE_CLASS( "Camera" )
STAGECORE_GROUP( Progress, "Progress" )
STAGECORE_GROUP( Internal, "Internal" )
STAGECORE_GROUP( PhysicalStatus, "PhysicalStatus" )
STAGECORE_GROUP( PhysicalSensorData, "PhysicalSensorData" )
STAGECORE_GROUP( CalibrationDetails, "CalibrationDetails" )
STAGECORE_GROUP( CalibrationMarkerBaseline, "CalibrationMarkerBaseline" )
STAGECORE_KEY( Settings, HasStrobe )
STAGECORE_KEY( Settings, VideoModeEnabled )
STAGECORE_KEY( Settings, ActiveMarkersEnabled )
STAGECORE_KEY( Settings, ContributingCentroids )
STAGECORE_KEY( Settings, ContributingGreyscale )
STAGECORE_KEY( Settings, ContributingVideo )
STAGECORE_KEY( Settings, Contributions )
}

namespace IMUHub
{
STAGECORE_CLASS( "IMUHub" )
STAGECORE_GROUP( Sensor, "Sensor" )
}

namespace VideoInput
{
STAGECORE_CLASS( "VideoInput" )
STAGECORE_GROUP( Progress, "Progress" )
STAGECORE_GROUP( CalibrationDetails, "CalibrationDetails" )
STAGECORE_KEY( Timecode, TimeOffsetFrames )
STAGECORE_KEY( Settings, TimeOffsetTicks )
STAGECORE_KEY( Settings, UseTimecodeForSync )
STAGECORE_KEY( Hardware, DriverName )
STAGECORE_KEY( Hardware, DeviceName )
STAGECORE_KEY( Hardware, Status )
STAGECORE_KEY( Hardware, VideoStandard )
STAGECORE_KEY( Hardware, TimecodeStandard )
STAGECORE_KEY( Settings, PixelFormat )
STAGECORE_KEY( Settings, AudioChannelCount )
STAGECORE_KEY( Settings, AudioSampleFormat )
STAGECORE_KEY( Settings, AudioSampleRate )
STAGECORE_KEY( Settings, TimecodeSource )
STAGECORE_KEY( Settings, PixelAspectRatio )
STAGECORE_KEY( Settings, Exposure )
STAGECORE_KEY( Settings, Gain )
STAGECORE_KEY( Settings, BlackLevel )
STAGECORE_KEY( Settings, Gamma )
STAGECORE_KEY( Settings, AutoWhiteBalance )
STAGECORE_KEY( Warnings, IncompatibleVideoStandard )
}

namespace Cluster
{
STAGECORE_CLASS( "Cluster" )
STAGECORE_KEY( Settings, ButtonsEnabled )
STAGECORE_KEY( Settings, ActiveMarkerBrightness )
STAGECORE_KEY( Settings, ActiveMarkerContinuousEnabled )
STAGECORE_KEY( Settings, ActiveMarkerPattern )
}

// What the system as a whole runs at.
namespace Gn6System
{
STAGECORE_NODE( Path, "Gn6System" )
STAGECORE_NODE( GenlockStandard, "Gn6System", "GenlockStandard" )
STAGECORE_NODE( FrameRateActual, "Gn6System", "FrameRateActual" )
}

namespace Nodes
{
STAGECORE_NODE( ApplicationSettings, "ApplicationSettings" )
STAGECORE_NODE( CaptureTake, "ApplicationSettings", "CaptureTake" )
STAGECORE_NODE( Capture, "ApplicationSettings", "Capture" )
STAGECORE_NODE( CaptureFileNameStem, "ApplicationSettings", "Capture", "FileNameStem" )
STAGECORE_NODE( Preferences, "Preferences" )
STAGECORE_NODE( SystemPreferences, "Preferences", "System" )
STAGECORE_NODE( DirectoryPreferences, "Preferences", "System", "Directory" )
STAGECORE_NODE( Camera, "Camera" )
STAGECORE_NODE( System, "System" )
STAGECORE_NODE( Graph, "Graph" )
STAGECORE_NODE( Agents, "Agents" )
STAGECORE_NODE( Subject, "Subject" )

STAGECORE_SEGMENT( CameraCalibration )
STAGECORE_SEGMENT( Orientation )
STAGECORE_SEGMENT( VolumeProperties )
STAGECORE_SEGMENT( ObjectPreset )
STAGECORE_SEGMENT( TemporarySettings )
STAGECORE_SEGMENT( SmartObject )
STAGECORE_SEGMENT( IXOMSystem )
STAGECORE_SEGMENT( Device )
STAGECORE_SEGMENT( CameraCalibrationMarkerBaseline )
}

}

#undef STAGECORE_GROUP
#undef STAGECORE_KEY_TEXT
#undef STAGECORE_KEY
#undef STAGECORE_CLASS
#undef STAGECORE_NODE
#undef STAGECORE_SEGMENT
