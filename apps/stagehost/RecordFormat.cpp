#include "apps/stagehost/RecordFormat.h"

#include "Core/VideoInterface/EnumTable.h"
#include "Core/VideoInterface/Schemas.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "apps/stagehost/NumberCheck.h"
#include "apps/stagehost/TextTable.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <array>
#include <cstdlib>

namespace
{

using KVZ::IAudioPayload;
using KVZ::IAudioSampleFormat;
using KVZ::IPixelFormat;
using KVZ::IVideoContainer;
using KVZ::IVideoPayload;

template<class TEnum>
struct VWord
{
  const char* m_pWord;
  TEnum m_Value;
};
constexpr std::array Containers = { VWord<IVideoContainer::Enum>{ "tvid", IVideoContainer::ETVID },
  VWord<IVideoContainer::Enum>{ "mov", IVideoContainer::EMOV }, VWord<IVideoContainer::Enum>{ "mp4", IVideoContainer::EMP4 },
  VWord<IVideoContainer::Enum>{ "avi", IVideoContainer::EAVI }, VWord<IVideoContainer::Enum>{ "mkv", IVideoContainer::EMKV },
  VWord<IVideoContainer::Enum>{ "images", IVideoContainer::EIMAGES } };
// In the order in which a container's own choice is made.
constexpr std::array VideoPayloads = { VWord<IVideoPayload::Enum>{ "uncompressed", IVideoPayload::EUncompressed },
  VWord<IVideoPayload::Enum>{ "jpeg", IVideoPayload::EImageJPEG }, VWord<IVideoPayload::Enum>{ "png", IVideoPayload::EImagePNG },
  VWord<IVideoPayload::Enum>{ "tiff", IVideoPayload::EImageTIFF } };
constexpr std::array AudioPayloads = { VWord<IAudioPayload::Enum>{ "uncompressed", IAudioPayload::EUncompressed },
  VWord<IAudioPayload::Enum>{ "none", IAudioPayload::ENone } };

// The words of those values that the predicate takes, in the table's order.
template<class TEnum, size_t Count, class TPredicate>
std::vector<std::string> WordsOf( const std::array<VWord<TEnum>, Count>& i_rWords, const TPredicate& i_rPredicate )
{
  std::vector<std::string> Words;
  for( const VWord<TEnum>& rRow : i_rWords )
  {
    if( i_rPredicate( rRow.m_Value ) )
    {
      Words.push_back( rRow.m_pWord );
    }
  }
  return Words;
}

template<class TEnum, size_t Count>
std::vector<std::string> WordsOf( const std::array<VWord<TEnum>, Count>& i_rWords )
{
  return WordsOf( i_rWords, []( TEnum ) { return true; } );
}

// The command line has been checked: a word is in its table.
template<class TEnum, size_t Count>
TEnum ValueOf( const std::array<VWord<TEnum>, Count>& i_rWords, const std::string& i_rWord )
{
  return std::find_if( i_rWords.begin(), i_rWords.end(), [&]( const VWord<TEnum>& i_rRow ) { return i_rWord == i_rRow.m_pWord; } )->m_Value;
}

template<class TEnum, size_t Count>
std::string WordOf( const std::array<VWord<TEnum>, Count>& i_rWords, TEnum i_Value )
{
  return std::find_if( i_rWords.begin(), i_rWords.end(), [&]( const VWord<TEnum>& i_rRow ) { return i_Value == i_rRow.m_Value; } )->m_pWord;
}

IVideoContainer::Enum ContainerOf( const std::string& i_rWord, const std::string& i_rSetting )
{
  auto Container = IVideoContainer::ETVID;
  KVZ::FromName( i_rSetting, Container );
  return i_rWord.empty() ? Container : ValueOf( Containers, i_rWord );
}

// The word's value; where there is no word, the setting, or else the first that the predicate takes.
template<class TEnum, size_t Count, class TPredicate>
TEnum PayloadOf( const std::array<VWord<TEnum>, Count>& i_rWords, const std::string& i_rWord, const std::string& i_rSetting,
  const TPredicate& i_rPredicate )
{
  if( !i_rWord.empty() )
  {
    return ValueOf( i_rWords, i_rWord );
  }
  TEnum Setting = i_rWords.front().m_Value;
  KVZ::FromName( i_rSetting, Setting );
  const std::vector<std::string> Supported = WordsOf( i_rWords, i_rPredicate );
  return i_rPredicate( Setting ) || Supported.empty() ? Setting : ValueOf( i_rWords, Supported.front() );
}

// The names of an enumeration's values that the predicate takes.
template<class TEnum, class TPredicate>
std::vector<std::string> NamesOf( const TPredicate& i_rPredicate )
{
  std::vector<std::string> Names;
  for( const KVZ::VEnumRow& rRow : KVZ::GetEnumTable( TEnum{} ).m_Rows )
  {
    const auto Value = static_cast<TEnum>( rRow.m_Value );
    if( Value != TEnum{} && i_rPredicate( Value ) )
    {
      Names.push_back( rRow.m_pName );
    }
  }
  return Names;
}

std::string Refusal( const std::string& i_rOption, const std::string& i_rWho, const std::vector<std::string>& i_rAccepted )
{
  return i_rOption + ": " + i_rWho + " takes " + ( i_rAccepted.empty() ? "none" : JoinTexts( i_rAccepted, ", " ) ) + ".";
}

bool CanConvert( IPixelFormat::Enum i_Source, IPixelFormat::Enum i_Target )
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = 48;   // a whole group of every format
  Info.m_ImageHeight = 1;
  Info.m_PixelFormat = i_Source;
  const std::vector<uint8_t> Source( KVZ::GetImageSize( i_Source, Info.m_ImageWidth, Info.m_ImageHeight ) );
  std::vector<uint8_t> Target( KVZ::GetImageSize( i_Target, Info.m_ImageWidth, Info.m_ImageHeight ) );
  return CoreVideoUtils::VPixelFormatConverter().Convert( Info, Source.data(), Source.size(), i_Target, Target.data(), Target.size() );
}

// The smallest number of channels that the device offers and that holds those asked for.
std::string DeviceChannels( const StageHost::VDeviceInfo& i_rDevice, uint32_t i_Channels )
{
  uint32_t Best = 0;
  bool bFound = false;
  for( const std::string& rCount : i_rDevice.m_AudioChannelCounts )
  {
    const uint32_t Count = static_cast<uint32_t>( std::strtoul( rCount.c_str(), nullptr, 10 ) );
    if( Count >= i_Channels && ( !bFound || Count < Best ) )
    {
      Best = Count;
      bFound = true;
    }
  }
  return bFound ? std::to_string( Best ) : std::to_string( i_Channels );
}

}

void AddFormatOptions( CLI::App& io_rCommand, VFormatOptions& io_rOptions )
{
  io_rCommand.add_option( "--container", io_rOptions.m_Container, "File format (default: the device's VideoContainer, tvid at first)" )
    ->check( CLI::IsMember( WordsOf( Containers ) ) );
  io_rCommand.add_option( "--video", io_rOptions.m_Video, "Video payload (default: the device's VideoPayload, where the container takes it)" )
    ->check( CLI::IsMember( WordsOf( VideoPayloads ) ) );
  io_rCommand.add_option( "--quality", io_rOptions.m_Quality, "Quality of jpeg (default: 90)" )
    ->type_name( "1-100" )
    ->check( WholeNumberCheck( 1.0, 100.0, "a whole number from 1 to 100" ) );
  io_rCommand
    .add_option( "--pixel-format", io_rOptions.m_PixelFormat, "Pixel format of the capture buffer, or that uncompressed video is stored in" )
    ->type_name( "NAME" );
  io_rCommand.add_option( "--burn-in", io_rOptions.m_BurnIn, "What is drawn into each picture" )->check( CLI::IsMember( { "timecode" } ) );
  io_rCommand.add_option( "--audio", io_rOptions.m_Audio, "Audio payload (default: the device's AudioPayload, where the container takes it)" )
    ->check( CLI::IsMember( WordsOf( AudioPayloads ) ) );
  io_rCommand.add_option( "--audio-channels", io_rOptions.m_AudioChannels, "Channels to keep" )
    ->check( WholeNumberCheck( 0.0, MostChannels, "a whole number from 0 to 16" ) )
    ->each( [&io_rOptions]( const std::string& ) { io_rOptions.m_bAudioChannels = true; } );
  io_rCommand.add_option( "--audio-format", io_rOptions.m_AudioFormat, "Sample format, for example Int16" );
}

VRecordFormat::VRecordFormat( const VFormatOptions& i_rOptions, const StageHost::VDeviceInfo& i_rDevice )
  : m_Options( i_rOptions ),
    m_Device( i_rDevice ),
    m_Container( ContainerOf( i_rOptions.m_Container, i_rDevice.m_Container ) ),
    m_Video( PayloadOf( VideoPayloads, i_rOptions.m_Video, i_rDevice.m_VideoPayload,
      [this]( IVideoPayload::Enum i_Payload ) { return Capabilities().IsVideoPayloadSupported( i_Payload ); } ) ),
    m_Audio( PayloadOf( AudioPayloads, i_rOptions.m_Audio, i_rDevice.m_AudioPayload,
      [this]( IAudioPayload::Enum i_Payload ) { return Capabilities().IsAudioPayloadSupported( i_Payload ); } ) )
{
}

const KVZ::IVideoWriterCapabilities& VRecordFormat::Capabilities() const { return KVZ::GetVideoWriterCapabilities( m_Container ); }

std::string VRecordFormat::WhyRefused() const
{
  const std::string Refusal = WhyNotStored();
  return Refusal.empty() ? WhyNotCaptured() : Refusal;
}

// With both words nothing of it depends on the device's settings.
std::string VRecordFormat::WhyRefused( const VFormatOptions& i_rOptions )
{
  const bool bSaid = !i_rOptions.m_Container.empty() && !i_rOptions.m_Video.empty();
  return bSaid ? VRecordFormat( i_rOptions, {} ).WhyNotStored() : "";
}

std::string VRecordFormat::WhyNotStored() const
{
  for( const std::string& rText : { WhyVideoRefused(), WhyPixelFormatRefused(), WhyAudioRefused() } )
  {
    if( !rText.empty() )
    {
      return rText;
    }
  }
  return {};
}

std::string VRecordFormat::WhyVideoRefused() const
{
  if( !Capabilities().IsVideoPayloadSupported( m_Video ) )
  {
    return Refusal( "--video " + m_Options.m_Video, "the container " + WordOf( Containers, m_Container ),
      WordsOf( VideoPayloads, [this]( IVideoPayload::Enum i_Payload ) { return Capabilities().IsVideoPayloadSupported( i_Payload ); } ) );
  }
  if( m_Options.m_Quality != 0 && m_Video != IVideoPayload::EImageJPEG )
  {
    return "--quality " + std::to_string( m_Options.m_Quality ) + ": only --video jpeg takes a quality.";
  }
  return {};
}

std::string VRecordFormat::WhyPixelFormatRefused() const
{
  if( m_Options.m_PixelFormat.empty() )
  {
    return {};
  }
  const bool bUncompressed = m_Video == IVideoPayload::EUncompressed;
  const auto IsTaken = [&]( IPixelFormat::Enum i_Format ) { return !bUncompressed || Capabilities().IsPixelFormatSupported( i_Format ); };
  auto Format = IPixelFormat::EUnspecified;
  const bool bKnown = KVZ::FromName( m_Options.m_PixelFormat, Format ) && Format != IPixelFormat::EUnspecified;
  return bKnown && IsTaken( Format )
    ? ""
    : Refusal( "--pixel-format " + m_Options.m_PixelFormat, "uncompressed video in the container " + WordOf( Containers, m_Container ),
        NamesOf<IPixelFormat::Enum>( IsTaken ) );
}

std::string VRecordFormat::WhyAudioRefused() const
{
  const std::string Who = "the container " + WordOf( Containers, m_Container );
  if( !Capabilities().IsAudioPayloadSupported( m_Audio ) )
  {
    return Refusal( "--audio " + m_Options.m_Audio, Who,
      WordsOf( AudioPayloads, [this]( IAudioPayload::Enum i_Payload ) { return Capabilities().IsAudioPayloadSupported( i_Payload ); } ) );
  }
  const uint32_t Channels = m_Options.m_AudioChannels;
  if( Channels != 0 && !Capabilities().IsChannelCountSupported( Channels ) )
  {
    std::vector<std::string> Counts = { "0" };
    for( uint32_t Count = 1; Count <= MostChannels; ++Count )
    {
      if( Capabilities().IsChannelCountSupported( Count ) )
      {
        Counts.push_back( std::to_string( Count ) );
      }
    }
    return Refusal( "--audio-channels " + std::to_string( Channels ), Who, Counts );
  }
  auto Format = IAudioSampleFormat::EUnspecified;
  const bool bFormat = !m_Options.m_AudioFormat.empty();
  if( bFormat && KVZ::FromName( m_Options.m_AudioFormat, Format ) && !Capabilities().IsAudioSampleFormatSupported( Format ) )
  {
    return Refusal( "--audio-format " + m_Options.m_AudioFormat, Who,
      NamesOf<IAudioSampleFormat::Enum>(
        [this]( IAudioSampleFormat::Enum i_Format ) { return Capabilities().IsAudioSampleFormatSupported( i_Format ); } ) );
  }
  return {};
}

bool VRecordFormat::IsCaptured( const std::string& i_rPixelFormat ) const
{
  return std::count( m_Device.m_PixelFormats.begin(), m_Device.m_PixelFormats.end(), i_rPixelFormat ) > 0;
}

bool VRecordFormat::IsStored( const std::string& i_rPixelFormat ) const
{
  auto Format = IPixelFormat::EUnspecified;
  KVZ::FromName( i_rPixelFormat, Format );
  return m_Video != IVideoPayload::EUncompressed || Capabilities().IsPixelFormatSupported( Format );
}

std::string VRecordFormat::CapturedPixelFormat() const
{
  if( !m_Options.m_PixelFormat.empty() )
  {
    return IsCaptured( m_Options.m_PixelFormat ) ? m_Options.m_PixelFormat : m_Device.m_PixelFormat;
  }
  std::vector<std::string> Choice = { m_Device.m_PixelFormat, KVZ::ToName( IPixelFormat::EU8Y8V8Y8 ) };
  Choice.insert( Choice.end(), m_Device.m_PixelFormats.begin(), m_Device.m_PixelFormats.end() );
  const auto Found = std::find_if( Choice.begin(), Choice.end(),
    [this]( const std::string& i_rName ) { return IsCaptured( i_rName ) && IsStored( i_rName ); } );
  return Found != Choice.end() ? *Found : m_Device.m_PixelFormat;
}

std::string VRecordFormat::WhatGaveWay() const
{
  const std::string Captured = CapturedPixelFormat();
  return !m_Options.m_PixelFormat.empty() || Captured == m_Device.m_PixelFormat ? ""
                                                                                : m_Device.m_URN + ": Uncompressed video in the container " +
      WordOf( Containers, m_Container ) + " does not take " + m_Device.m_PixelFormat + "; " + Captured + " is captured instead.";
}

// A format that the device cannot capture is made of the one that it has.
std::string VRecordFormat::WhyNotCaptured() const
{
  if( m_Options.m_PixelFormat.empty() || IsCaptured( m_Options.m_PixelFormat ) )
  {
    return {};
  }
  auto Captured = IPixelFormat::EUnspecified;
  auto Wanted = IPixelFormat::EUnspecified;
  KVZ::FromName( m_Device.m_PixelFormat, Captured );
  KVZ::FromName( m_Options.m_PixelFormat, Wanted );
  const auto IsTaken = [&]( IPixelFormat::Enum i_Format )
  {
    const std::vector<std::string>& rOwn = m_Device.m_PixelFormats;
    return std::count( rOwn.begin(), rOwn.end(), KVZ::ToName( i_Format ) ) > 0 ||
      ( m_Video == IVideoPayload::EUncompressed && Capabilities().IsPixelFormatSupported( i_Format ) && CanConvert( Captured, i_Format ) );
  };
  return IsTaken( Wanted ) ? "" : Refusal( "--pixel-format " + m_Options.m_PixelFormat, m_Device.m_URN, NamesOf<IPixelFormat::Enum>( IsTaken ) );
}

VWantedSetting VRecordFormat::Container() const
{
  return { "VideoContainer", KVZ::ToName( m_Container ), "--container " + WordOf( Containers, m_Container ) };
}

std::vector<std::string> VRecordFormat::OfferedVideoPayloads() const
{
  std::vector<std::string> Names;
  for( const KVZ::VEnumRow& rRow : KVZ::GetEnumTable( IVideoPayload::Enum{} ).m_Rows )
  {
    if( Capabilities().IsVideoPayloadSupported( static_cast<IVideoPayload::Enum>( rRow.m_Value ) ) )
    {
      Names.push_back( rRow.m_pName );
    }
  }
  return Names;
}

std::vector<VWantedSetting> VRecordFormat::Settings() const
{
  std::vector<VWantedSetting> Wanted;
  const std::string PixelFormat = CapturedPixelFormat();
  if( PixelFormat != m_Device.m_PixelFormat )
  {
    Wanted.push_back( { "PixelFormat", PixelFormat, "--pixel-format " + PixelFormat } );
  }
  if( m_Options.m_bAudioChannels )
  {
    Wanted.push_back( { "AudioChannelCount", DeviceChannels( m_Device, m_Options.m_AudioChannels ),
      "--audio-channels " + std::to_string( m_Options.m_AudioChannels ) } );
  }
  if( !m_Options.m_AudioFormat.empty() )
  {
    Wanted.push_back( { "AudioSampleFormat", m_Options.m_AudioFormat, "--audio-format " + m_Options.m_AudioFormat } );
  }
  Wanted.push_back( { "VideoPayload", KVZ::ToName( m_Video ), "--video " + WordOf( VideoPayloads, m_Video ) } );
  Wanted.push_back( { "AudioPayload", KVZ::ToName( m_Audio ), "--audio " + WordOf( AudioPayloads, m_Audio ) } );
  return Wanted;
}

void ApplyFormat( const VFormatOptions& i_rOptions, StageHost::VCaptureTargetOptions& o_rTargets )
{
  if( i_rOptions.m_bAudioChannels )
  {
    o_rTargets.m_AudioChannels = i_rOptions.m_AudioChannels;
  }
  KVZ::FromName( i_rOptions.m_PixelFormat, o_rTargets.m_PixelFormat );
  o_rTargets.m_JPEGQuality = i_rOptions.m_Quality;
  o_rTargets.m_bBurnInTimecode = !i_rOptions.m_BurnIn.empty();
}
