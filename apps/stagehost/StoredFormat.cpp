#include "apps/stagehost/StoredFormat.h"

#include "Core/VideoInterface/EnumTable.h"
#include "Core/VideoInterface/Schemas.h"
#include "Core/VideoInterface/VideoStandard.h"

#include <algorithm>
#include <cstdlib>

namespace
{

template<class TEnum>
TEnum ReadSetting( VHostSession& i_rSession, const std::string& i_rURN, const char* i_pKey )
{
  TEnum Value{};
  const auto Setting = i_rSession.Settings().Find( StageHost::VDeviceSettings::SettingPath( i_rURN, i_pKey ) );
  if( Setting )
  {
    KVZ::FromName( Setting->m_Value, Value );
  }
  return Value;
}

uint32_t ReadNumber( VHostSession& i_rSession, const std::string& i_rURN, const char* i_pKey )
{
  const auto Setting = i_rSession.Settings().Find( StageHost::VDeviceSettings::SettingPath( i_rURN, i_pKey ) );
  return Setting ? static_cast<uint32_t>( std::strtoul( Setting->m_Value.c_str(), nullptr, 10 ) ) : 0;
}

// Those that the card delivers, as far as they were asked for and the container takes them.
uint32_t KeptChannels( uint32_t i_Captured, const VFormatOptions& i_rOptions, KVZ::IVideoContainer::Enum i_Container )
{
  uint32_t Kept = std::min( i_Captured, i_rOptions.m_bAudioChannels ? i_rOptions.m_AudioChannels : MostChannels );
  while( Kept > 0 && !KVZ::GetVideoWriterCapabilities( i_Container ).IsChannelCountSupported( Kept ) )
  {
    --Kept;
  }
  return Kept;
}

}

VStoredFormat ReadStoredFormat( VHostSession& i_rSession, const StageHost::VDeviceInfo& i_rDevice, const VFormatOptions& i_rOptions )
{
  const std::string& rURN = i_rDevice.m_URN;
  VStoredFormat Format;
  Format.m_Container = ReadSetting<KVZ::IVideoContainer::Enum>( i_rSession, rURN, "VideoContainer" );
  auto Standard = KVZ::IVideoStandard::EUnspecified;
  KVZ::FromName( i_rDevice.m_Standard, Standard );
  Format.m_FramePeriod = static_cast<uint32_t>( KVZ::GetFramePeriod( Standard ) );
  const bool bUncompressed = ReadSetting<KVZ::IVideoPayload::Enum>( i_rSession, rURN, "VideoPayload" ) == KVZ::IVideoPayload::EUncompressed;
  const KVZ::VVideoStandardRow* const pRow = KVZ::FindVideoStandard( Standard );
  if( bUncompressed && pRow )
  {
    auto Pixels = ReadSetting<KVZ::IPixelFormat::Enum>( i_rSession, rURN, "PixelFormat" );
    KVZ::FromName( i_rOptions.m_PixelFormat, Pixels );
    Format.m_ImageBytes = KVZ::GetImageSize( Pixels, pRow->m_Width, pRow->m_Height );
  }
  if( ReadSetting<KVZ::IAudioPayload::Enum>( i_rSession, rURN, "AudioPayload" ) != KVZ::IAudioPayload::ENone )
  {
    Format.m_Audio.m_SampleFormat = ReadSetting<KVZ::IAudioSampleFormat::Enum>( i_rSession, rURN, "AudioSampleFormat" );
    Format.m_Audio.m_SampleRate = ReadNumber( i_rSession, rURN, "AudioSampleRate" );
    Format.m_Audio.m_Channels = KeptChannels( ReadNumber( i_rSession, rURN, "AudioChannelCount" ), i_rOptions, Format.m_Container );
  }
  return Format;
}
