#include "host/DeviceSettings.h"

#include "StageCoreDataStore/DataStorePersistence.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCoreParameters/ParameterGroup.h"
#include "host/CaptureTargets.h"

namespace StageHost
{

namespace
{

template<class TGet>
std::string TextOf( const IParameter& i_rParameter, TGet i_Get )
{
  KVZ::Variant Value;
  return ( i_rParameter.*i_Get )( Value ) ? Value.ToText() : std::string();
}

std::vector<std::string> Labels( const IParameter& i_rParameter )
{
  std::vector<std::string> Texts;
  i_rParameter.GetEnum( Texts );
  return Texts;
}

VSettingInfo Describe( const IParameter& i_rParameter )
{
  VSettingInfo Info;
  Info.m_Path = i_rParameter.GetHandle().Path().ToString();
  Info.m_Value = TextOf( i_rParameter, &IParameter::GetValue );
  Info.m_Proposed = TextOf( i_rParameter, &IParameter::GetProposedValue );
  Info.m_Default = TextOf( i_rParameter, &IParameter::GetValueDefault );
  Info.m_Type = i_rParameter.GetSchema()->Name();
  Info.m_Display = i_rParameter.GetDisplay();
  Info.m_Description = i_rParameter.GetDescription();
  Info.m_Category = i_rParameter.GetCategory();
  Info.m_Minimum = TextOf( i_rParameter, &IParameter::GetMin );
  Info.m_Maximum = TextOf( i_rParameter, &IParameter::GetMax );
  Info.m_Allowed = Labels( i_rParameter );
  Info.m_bReadOnly = i_rParameter.IsReadOnly();
  Info.m_bHidden = i_rParameter.IsHidden();
  Info.m_bAdvanced = i_rParameter.IsAdvanced();
  Info.m_bVerifyRequired = i_rParameter.IsVerifyRequired();
  Info.m_bNotSerialized = i_rParameter.IsNotSerialized();
  Info.m_bInTicks = i_rParameter.GetDataConversionHint() != Parameter::DataConversionHint::ENoConversion;
  return Info;
}

// The value that a text stands for: a label of the list where there is one, else the value's own text.
boost::optional<KVZ::Variant> ValueFor( const IParameter& i_rParameter, const std::string& i_rText )
{
  VParameterChoices Choices;
  i_rParameter.GetEnum( Choices );
  for( const KVZ::VLabelledVariant& rChoice : Choices )
  {
    if( rChoice.m_Label == i_rText )
    {
      return rChoice.m_Value;
    }
  }
  const auto Value = KVZ::Variant::FromText( i_rParameter.GetSchema(), i_rText );
  return Value ? boost::optional<KVZ::Variant>( *Value ) : boost::none;
}

std::string UnknownSetting( const std::string& i_rPath ) { return "There is no setting \"" + i_rPath + "\"; \"params list\" shows them all."; }

std::string JoinAllowed( const std::vector<std::string>& i_rTexts )
{
  std::string Joined;
  for( const std::string& rText : i_rTexts )
  {
    Joined += ( Joined.empty() ? "" : ", " ) + rText;
  }
  return Joined;
}

}

std::string WhatIsAccepted( const IParameter& i_rParameter )
{
  const std::vector<std::string> Allowed = Labels( i_rParameter );
  if( !Allowed.empty() )
  {
    return "it takes: " + JoinAllowed( Allowed );
  }
  if( i_rParameter.HasMin() || i_rParameter.HasMax() )
  {
    return "it takes values from " + ( i_rParameter.HasMin() ? TextOf( i_rParameter, &IParameter::GetMin ) : "any" ) + " to " +
      ( i_rParameter.HasMax() ? TextOf( i_rParameter, &IParameter::GetMax ) : "any" );
  }
  return "it takes a value of the type " + i_rParameter.GetSchema()->Name();
}

void SetDefault( IParameter& io_rParameter )
{
  KVZ::Variant Default;
  VParameterChoices Choices;
  if( io_rParameter.GetValueDefault( Default ) && !io_rParameter.SetValue( Default ) && io_rParameter.GetEnum( Choices ) && !Choices.empty() )
  {
    io_rParameter.SetValue( Choices.front().m_Value );
  }
}

VDeviceSettings::VDeviceSettings( std::shared_ptr<IDataStore> i_pDataStore, const VParameterRegistry& i_rRegistry )
  : m_pDataStore( std::move( i_pDataStore ) ), m_rRegistry( i_rRegistry )
{
}

std::string VDeviceSettings::SettingPath( const std::string& i_rDeviceURN, const std::string& i_rKey )
{
  return ( DeviceSchemas::Settings( DeviceSchemas::VideoInput::Path( i_rDeviceURN ) ) + i_rKey ).ToString();
}

std::shared_ptr<IParameter> VDeviceSettings::FindParameter( const std::string& i_rPath ) const
{
  const VDataPathHandle Handle( VDataPath::FromString( i_rPath ) );
  for( const std::shared_ptr<IParameterGroup>& pGroup : m_rRegistry.GetGroups() )
  {
    for( const std::shared_ptr<IParameter>& pParameter : pGroup->GetParameters() )
    {
      if( pParameter->GetHandle().Path() == Handle.Path() )
      {
        return pParameter;
      }
    }
  }
  return {};
}

std::vector<VSettingInfo> VDeviceSettings::List() const
{
  std::vector<VSettingInfo> Settings;
  for( const std::shared_ptr<IParameterGroup>& pGroup : m_rRegistry.GetGroups() )
  {
    for( const std::shared_ptr<IParameter>& pParameter : pGroup->GetParameters() )
    {
      Settings.push_back( Describe( *pParameter ) );
    }
  }
  return Settings;
}

boost::optional<VSettingInfo> VDeviceSettings::Find( const std::string& i_rPath ) const
{
  const std::shared_ptr<IParameter> pParameter = FindParameter( i_rPath );
  return pParameter ? boost::optional<VSettingInfo>( Describe( *pParameter ) ) : boost::none;
}

bool VDeviceSettings::Set( const std::string& i_rPath, const std::string& i_rValue, std::string& o_rError )
{
  const std::shared_ptr<IParameter> pParameter = FindParameter( i_rPath );
  if( !pParameter )
  {
    o_rError = UnknownSetting( i_rPath );
    return false;
  }
  if( pParameter->IsReadOnly() )
  {
    o_rError = i_rPath + " is read-only.";
    return false;
  }
  const auto Value = ValueFor( *pParameter, i_rValue );
  if( !Value || !pParameter->SetValue( *Value ) )
  {
    o_rError = i_rPath + " cannot be \"" + i_rValue + "\": " + WhatIsAccepted( *pParameter ) + ".";
    return false;
  }
  return true;
}

std::vector<VDataPath> VDeviceSettings::Reset( const std::string& i_rPath, std::string& o_rError )
{
  const VDataPath Branch = VDataPath::FromString( i_rPath );
  std::vector<VDataPath> Paths;
  o_rError = UnknownSetting( i_rPath );
  VDataWriter Writer( *m_pDataStore );   // devices hear of the end alone
  for( const std::shared_ptr<IParameterGroup>& pGroup : m_rRegistry.GetGroups() )
  {
    for( const std::shared_ptr<IParameter>& pParameter : pGroup->GetParameters() )
    {
      const VDataPath& rPath = pParameter->GetHandle().Path();
      if( Branch.IsEmpty() || !rPath.BeginsWith( Branch ) )
      {
        continue;
      }
      if( pParameter->IsReadOnly() )
      {
        o_rError = i_rPath + " is read-only.";
        continue;
      }
      DataStorePersistence::RemoveParameterValues( Writer, rPath );
      SetDefault( *pParameter );
      Paths.push_back( rPath );
    }
  }
  return Paths;
}

bool VDeviceSettings::IsSettled( const std::string& i_rPath ) const
{
  return VDataReader( *m_pDataStore ).IsSettled( VDataPath::FromString( i_rPath ) );
}

// A device's group is registered once all its settings have been made, so a device that is seen here is complete.
std::vector<VDeviceInfo> VDeviceSettings::GetDevices() const
{
  std::vector<VDeviceInfo> Devices;
  for( const std::shared_ptr<IParameterGroup>& pGroup : m_rRegistry.GetGroups() )
  {
    const VDataPath& rPath = pGroup->GetPath();
    if( rPath.Size() == 2 && rPath.BeginsWith( DeviceSchemas::VideoInput::Path() ) )
    {
      Devices.push_back( DescribeDevice( *pGroup, rPath.Name() ) );
    }
  }
  return Devices;
}

VDeviceInfo VDeviceSettings::DescribeDevice( const IParameterGroup& i_rGroup, const std::string& i_rURN ) const
{
  const auto Text = [&]( const char* i_pKey )
  {
    const auto pParameter = i_rGroup.GetParameter( std::string_view( i_pKey ) );
    return pParameter ? TextOf( *pParameter, &IParameter::GetValue ) : std::string();
  };
  const auto Choices = [&]( const char* i_pKey )
  {
    const auto pParameter = i_rGroup.GetParameter( std::string_view( i_pKey ) );
    return pParameter ? Labels( *pParameter ) : std::vector<std::string>();
  };
  VDeviceInfo Info;
  Info.m_URN = i_rURN;
  Info.m_Name = Text( "DeviceName" );
  Info.m_Driver = Text( "DriverName" );
  Info.m_Standard = Text( "VideoStandard" );
  Info.m_Status = Text( "Status" );
  Info.m_Timecode = Text( "TimecodeStandard" );
  Info.m_PixelFormat = Text( "PixelFormat" );
  Info.m_PixelFormats = Choices( "PixelFormat" );
  Info.m_AudioFormat = Text( "AudioSampleFormat" );
  Info.m_AudioChannels = Text( "AudioChannelCount" );
  Info.m_Container = Text( "VideoContainer" );
  Info.m_VideoPayload = Text( "VideoPayload" );
  Info.m_AudioPayload = Text( "AudioPayload" );
  Info.m_bEnabled = Text( "Enabled" ) == "true";
  Info.m_AudioChannelCounts = Choices( "AudioChannelCount" );
  Info.m_Label = MakeDeviceLabel( i_rURN, Text( "Name" ) );

  const VDataReader Reader( *m_pDataStore );
  std::vector<VDataPath> Warnings;
  Reader.GetValuePaths( DeviceSchemas::Warnings( DeviceSchemas::VideoInput::Path( i_rURN ) ), Warnings );
  for( const VDataPath& rPath : Warnings )
  {
    Info.m_Warnings.push_back( Reader.GetValue( rPath ).ToText() );
  }
  return Info;
}

}
