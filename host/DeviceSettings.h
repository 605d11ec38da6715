// Reads and changes the settings that devices publish in the data store, by text, for a person or a script.
//
// Every operation may be called from any thread. Changes act on the module's own threads: WaitUntilSettled tells when.
#pragma once

#include "StageCoreDataStoreTypes/DataPath.h"
#include "host/Registries.h"

#include <boost/optional.hpp>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

class IDataStore;
class IParameter;
class IParameterGroup;

namespace StageHost
{

struct VDeviceInfo
{
  std::string m_URN;
  std::string m_Name;   // of the device
  std::string m_Driver;
  std::string m_Standard;   // "Unspecified" without a signal
  std::string m_Status;
  std::string m_Timecode;   // "Receiving 25 fps" or "Not Detected"
  std::string m_PixelFormat;
  std::vector<std::string> m_PixelFormats;
  std::string m_AudioFormat;
  std::string m_AudioChannels;
  std::vector<std::string> m_AudioChannelCounts;
  std::string m_Container;   // of recordings
  std::string m_VideoPayload;
  std::string m_AudioPayload;
  std::string m_Label;   // the user's name for the device, or the URN without its colon
  std::vector<std::string> m_Warnings;
  bool m_bEnabled = false;

  bool HasSignal() const { return m_Standard != "Unspecified"; }
};

struct VSettingInfo
{
  std::string m_Path;       // "VideoInput.vi:0.Settings.Enabled"
  std::string m_Value;      // empty where it has none
  std::string m_Proposed;   // what was asked for; another one where the owner has not accepted it
  std::string m_Default;    // empty where there is none
  std::string m_Type;       // the schema's name
  std::string m_Display;
  std::string m_Description;
  std::string m_Category;
  std::string m_Minimum;   // empty where there is none
  std::string m_Maximum;
  std::vector<std::string> m_Allowed;   // labels, empty where everything is
  bool m_bReadOnly = false;
  bool m_bHidden = false;
  bool m_bAdvanced = false;
  bool m_bVerifyRequired = false;
  bool m_bNotSerialized = false;
  bool m_bInTicks = false;   // a time in ticks of 1/135000000 s, whatever unit its display text names
};

// For people, as the end of a line that says what was refused: "it takes values from 0 to 1".
std::string WhatIsAccepted( const IParameter& i_rParameter );

// As a device that has just appeared takes it: where the default is not allowed now, the first value that is.
void SetDefault( IParameter& io_rParameter );

class VDeviceSettings
{
public:
  VDeviceSettings( std::shared_ptr<IDataStore> i_pDataStore, const VParameterRegistry& i_rRegistry );

  // In the order of the indices; a device appears once its settings are complete.
  std::vector<VDeviceInfo> GetDevices() const;

  // All settings of all groups, in the order in which they were made.
  std::vector<VSettingInfo> List() const;
  boost::optional<VSettingInfo> Find( const std::string& i_rPath ) const;

  // The user's write. False with the reason in o_rError: unknown, read-only, not such a value, not allowed.
  bool Set( const std::string& i_rPath, const std::string& i_rValue, std::string& o_rError );

  // Gives the setting of this path, or all below it, back to their defaults; those without one have no value then. Read-only ones stay. The
  // paths of those that were reset; empty, with the reason in o_rError, where there are none.
  std::vector<VDataPath> Reset( const std::string& i_rPath, std::string& o_rError );

  // "VideoInput.vi:0.Settings.Enabled" for ( "vi:0", "Enabled" ).
  static std::string SettingPath( const std::string& i_rDeviceURN, const std::string& i_rKey );

  // The proposed value of a setting that its owner verifies is the verified one. False where there is no value.
  bool IsSettled( const std::string& i_rPath ) const;

private:
  std::shared_ptr<IParameter> FindParameter( const std::string& i_rPath ) const;
  VDeviceInfo DescribeDevice( const IParameterGroup& i_rGroup, const std::string& i_rURN ) const;

  const std::shared_ptr<IDataStore> m_pDataStore;
  const VParameterRegistry& m_rRegistry;
};

}
