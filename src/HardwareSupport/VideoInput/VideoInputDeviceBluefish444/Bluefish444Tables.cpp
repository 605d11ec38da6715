#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Tables.h"

#include "StageCoreRuntime/GlobalLog.h"
#include "VendorInterfaces/BlueVelvet.h"

#include <algorithm>
#include <array>

namespace VideoInputHAL
{

namespace
{

using KVZ::IAudioSampleFormat;
using KVZ::IPixelFormat;
using KVZ::IVideoStandard;

namespace Format = BlueVelvet::MemoryFormat;
namespace Flag = BlueVelvet::SampleFlag;

// By card type
constexpr std::array CardNames = { "Bluedeep LT", "Bluedeep SD", "Bluedeep AV", "Bluedeep IO", "Bluewild AV", "Iridium HD", "Bluewild RT",
  "Bluewild HD", "Reddevil", "Bluedeep HD/Epoch 2K", "Bluedeep HDS", "Envy", "Pride", "Greed", "Ingest", "SD Duallink", "Catalyst", "SD Duallink Pro",
  "SD Ingest Pro", "SD Deepblue Lite Pro", "SD Singlelink Pro", "SD Iridium AV Pro", "SD Fidelity", "SD Focus", "SD Prime", "Epoch 2K Core",
  "Epoch 2K Ultra", "Epoch Horizon", "Epoch Core", "Epoch Ultra", "Create HD", "Create 2K/3D", "Create 2K/3D Ultra", "Super Nova",
  "Super Nova S Plus", "Neutron", "Epoch CG", "Invalid card" };
static_assert( CardNames.size() == 38 );

struct VChannelRow
{
  uint32_t m_Channel;
  const char* m_pLetter;
  uint32_t m_Routing;   // source, destination in the next byte, single link
};

constexpr std::array Channels = {
  VChannelRow{ 2, "A", 0x30000F05 },
  VChannelRow{ 3, "B", 0x30001006 },
  VChannelRow{ 4, "C", 0x30001607 },
  VChannelRow{ 5, "D", 0x30001708 },
};
constexpr VChannelRow NoChannel{ 0, "?", 0x30000000 };

const VChannelRow& FindChannel( uint32_t i_Channel )
{
  const auto Found = std::find_if( Channels.begin(), Channels.end(), [&]( const VChannelRow& i_r ) { return i_r.m_Channel == i_Channel; } );
  return Found != Channels.end() ? *Found : NoChannel;
}

constexpr uint32_t DvbAsiMode = 32;

// By mode; the one of no video stands for what it is taken for.
constexpr std::array Modes = {
  IVideoStandard::ESD_720_576I_5000,       // 0
  IVideoStandard::ESD_720_486I_5994,       // 1
  IVideoStandard::EHD_1280_720P_5994,      // 2
  IVideoStandard::EHD_1280_720P_6000,      // 3
  IVideoStandard::EHD_1920_1080PSF_2398,   // 4
  IVideoStandard::EHD_1920_1080PSF_2400,   // 5
  IVideoStandard::EHD_1920_1080P_2398,     // 6
  IVideoStandard::EHD_1920_1080P_2400,     // 7
  IVideoStandard::EHD_1920_1080I_5000,     // 8
  IVideoStandard::EHD_1920_1080I_5994,     // 9
  IVideoStandard::EHD_1920_1080I_6000,     // 10
  IVideoStandard::EHD_1920_1080P_2500,     // 11
  IVideoStandard::EHD_1920_1080P_2997,     // 12
  IVideoStandard::EHD_1920_1080P_3000,     // 13
  IVideoStandard::EHD_2048_1556PSF_1498,   // 14
  IVideoStandard::EHD_2048_1556PSF_1500,   // 15
  IVideoStandard::EHD_1280_720P_5000,      // 16
  IVideoStandard::EHD_1280_720P_2398,      // 17
  IVideoStandard::EHD_1280_720P_2400,      // 18
  IVideoStandard::EHD_2048_1080PSF_2398,   // 19
  IVideoStandard::EHD_2048_1080PSF_2400,   // 20
  IVideoStandard::EHD_2048_1080P_2398,     // 21
  IVideoStandard::EHD_2048_1080P_2400,     // 22
  IVideoStandard::EHD_1920_1080PSF_2500,   // 23
  IVideoStandard::EHD_1920_1080PSF_2997,   // 24
  IVideoStandard::EHD_1920_1080PSF_3000,   // 25
  IVideoStandard::EHD_1920_1080P_5000,     // 26
  IVideoStandard::EHD_1920_1080P_5994,     // 27
  IVideoStandard::EHD_1920_1080P_6000,     // 28
  IVideoStandard::EHD_1280_720P_2500,      // 29
  IVideoStandard::EHD_1280_720P_2997,      // 30
  IVideoStandard::EHD_1280_720P_3000,      // 31
  IVideoStandard::ESD_720_576I_5000,       // 32: DVB-ASI
  IVideoStandard::EHD_2048_1080PSF_2500,   // 33
  IVideoStandard::EHD_2048_1080PSF_2997,   // 34
  IVideoStandard::EHD_2048_1080PSF_3000,   // 35
  IVideoStandard::EHD_2048_1080P_2500,     // 36
  IVideoStandard::EHD_2048_1080P_2997,     // 37
  IVideoStandard::EHD_2048_1080P_3000,     // 38
  IVideoStandard::EHD_2048_1080P_5000,     // 39
  IVideoStandard::EHD_2048_1080P_5994,     // 40
  IVideoStandard::EHD_2048_1080P_6000,     // 41
  IVideoStandard::EHD_1920_1080P_4800,     // 42
  IVideoStandard::EHD_2048_1080P_4800,     // 43
  IVideoStandard::EUnspecified,            // 44
};
static_assert( Modes.size() == DefaultNoSignalMode + 1 );

struct VFormatRow
{
  IPixelFormat::Enum m_PixelFormat;
  uint32_t m_MemoryFormat;
};

constexpr std::array Formats = {
  VFormatRow{ IPixelFormat::ELuminance8, Format::YUVAlpha },
  VFormatRow{ IPixelFormat::ER8G8B8, Format::RGB },
  VFormatRow{ IPixelFormat::EB8G8R8, Format::BGR },
  VFormatRow{ IPixelFormat::ER8G8B8u8, Format::RGBA },
  VFormatRow{ IPixelFormat::EB8G8R8u8, Format::ARGBPC },
  VFormatRow{ IPixelFormat::EU8Y8V8Y8, Format::TwoVUY },
  VFormatRow{ IPixelFormat::EY8U8Y8V8, Format::BV8 },
  VFormatRow{ IPixelFormat::EU10Y10V10Y10, Format::V210 },
};

struct VSamplesRow
{
  int64_t m_Period;
  uint32_t m_Samples;
};

constexpr std::array Samples = { VSamplesRow{ 4504500, 1601 }, VSamplesRow{ 5630625, 2002 }, VSamplesRow{ 2252250, 800 }, VSamplesRow{ 2250000, 800 },
  VSamplesRow{ 5400000, 1920 }, VSamplesRow{ 2700000, 960 }, VSamplesRow{ 5625000, 2000 }, VSamplesRow{ 4500000, 1600 },
  VSamplesRow{ 2812500, 1000 } };

constexpr uint32_t LowerChannels = 8;
constexpr uint32_t AnalogueChannels = 2;

}

std::string CardName( int i_CardType )
{
  const bool bKnown = i_CardType >= 0 && static_cast<size_t>( i_CardType ) < CardNames.size();
  return bKnown ? CardNames[static_cast<size_t>( i_CardType )] : "Unknown card";
}

std::string ChannelLetter( uint32_t i_Channel ) { return FindChannel( i_Channel ).m_pLetter; }

uint32_t ChannelRouting( uint32_t i_Channel )
{
  const VChannelRow& rChannel = FindChannel( i_Channel );
  if( &rChannel == &NoChannel )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Unknown channel." );
  }
  return rChannel.m_Routing;
}

IVideoStandard::Enum StandardOfMode( uint32_t i_Mode )
{
  if( i_Mode >= Modes.size() )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Invalid video standard." );
    return IVideoStandard::ESD_720_576I_5000;
  }
  if( i_Mode == DvbAsiMode )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Unsupported video standard." );
  }
  return Modes[i_Mode];
}

uint32_t ToMemoryFormat( IPixelFormat::Enum i_PixelFormat )
{
  const auto Found = std::find_if( Formats.begin(), Formats.end(), [&]( const VFormatRow& i_r ) { return i_r.m_PixelFormat == i_PixelFormat; } );
  if( Found == Formats.end() )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Unsupported pixel format." );
    return 0;
  }
  return Found->m_MemoryFormat;
}

uint32_t SamplesPerFrame( int64_t i_FramePeriod )
{
  const auto Found = std::find_if( Samples.begin(), Samples.end(), [&]( const VSamplesRow& i_r ) { return i_r.m_Period == i_FramePeriod; } );
  return Found != Samples.end() ? Found->m_Samples : 0;
}

uint32_t ChannelMask( uint32_t i_Channels )
{
  const uint32_t Count = std::min( i_Channels, MostAudioChannels );
  const uint32_t Lower = ( 1u << std::min( Count, LowerChannels ) ) - 1;
  const uint32_t Upper = Count > LowerChannels ? ( 1u << ( Count - LowerChannels ) ) - 1 : 0;
  return Lower | Upper << ( LowerChannels + AnalogueChannels );
}

VSampleType ToSampleType( IAudioSampleFormat::Enum i_Format )
{
  switch( i_Format )
  {
    case IAudioSampleFormat::EInt24: return { Flag::Bits24, 3 };
    case IAudioSampleFormat::EInt32: return { Flag::Bits32, 4 };
    default: return { Flag::Bits16, 2 };
  }
}

}
