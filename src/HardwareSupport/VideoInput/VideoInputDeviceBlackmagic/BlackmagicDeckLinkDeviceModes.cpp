#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceModes.h"

#include "StageCoreRuntime/GlobalLog.h"
#include "VendorInterfaces/DeckLinkAPI.h"

#include <algorithm>
#include <array>

namespace VideoInputHAL
{

namespace
{

using DeckLinkAPI::FourCharacterCode;
using KVZ::IPixelFormat;
using KVZ::IVideoStandard;

struct VModeRow
{
  uint32_t m_Mode;
  IVideoStandard::Enum m_Standard;
};

constexpr std::array Modes = {
  VModeRow{ FourCharacterCode( "ntsc" ), IVideoStandard::ESD_720_486I_5994 },
  VModeRow{ FourCharacterCode( "nt23" ), IVideoStandard::ESD_720_486P_2398 },
  VModeRow{ FourCharacterCode( "ntsp" ), IVideoStandard::ESD_720_486P_5994 },
  VModeRow{ FourCharacterCode( "pal " ), IVideoStandard::ESD_720_576I_5000 },
  VModeRow{ FourCharacterCode( "palp" ), IVideoStandard::ESD_720_576P_5000 },
  VModeRow{ FourCharacterCode( "hp50" ), IVideoStandard::EHD_1280_720P_5000 },
  VModeRow{ FourCharacterCode( "hp59" ), IVideoStandard::EHD_1280_720P_5994 },
  VModeRow{ FourCharacterCode( "hp60" ), IVideoStandard::EHD_1280_720P_6000 },
  VModeRow{ FourCharacterCode( "Hi50" ), IVideoStandard::EHD_1920_1080I_5000 },
  VModeRow{ FourCharacterCode( "Hi59" ), IVideoStandard::EHD_1920_1080I_5994 },
  VModeRow{ FourCharacterCode( "Hi60" ), IVideoStandard::EHD_1920_1080I_6000 },
  VModeRow{ FourCharacterCode( "23ps" ), IVideoStandard::EHD_1920_1080P_2398 },
  VModeRow{ FourCharacterCode( "24ps" ), IVideoStandard::EHD_1920_1080P_2400 },
  VModeRow{ FourCharacterCode( "Hp25" ), IVideoStandard::EHD_1920_1080P_2500 },
  VModeRow{ FourCharacterCode( "Hp29" ), IVideoStandard::EHD_1920_1080P_2997 },
  VModeRow{ FourCharacterCode( "Hp30" ), IVideoStandard::EHD_1920_1080P_3000 },
  VModeRow{ FourCharacterCode( "Hp50" ), IVideoStandard::EHD_1920_1080P_5000 },
  VModeRow{ FourCharacterCode( "Hp59" ), IVideoStandard::EHD_1920_1080P_5994 },
  VModeRow{ FourCharacterCode( "Hp60" ), IVideoStandard::EHD_1920_1080P_6000 },
  VModeRow{ FourCharacterCode( "2k23" ), IVideoStandard::EHD_2048_1556P_2398 },
  VModeRow{ FourCharacterCode( "2k24" ), IVideoStandard::EHD_2048_1556P_2400 },
  VModeRow{ FourCharacterCode( "2k25" ), IVideoStandard::EHD_2048_1556P_2500 },
  VModeRow{ FourCharacterCode( "2d23" ), IVideoStandard::EHD_2048_1080P_2398 },
  VModeRow{ FourCharacterCode( "2d24" ), IVideoStandard::EHD_2048_1080P_2400 },
  VModeRow{ FourCharacterCode( "2d25" ), IVideoStandard::EHD_2048_1080P_2500 },
  VModeRow{ FourCharacterCode( "4k23" ), IVideoStandard::EHD_3840_2160P_2398 },
  VModeRow{ FourCharacterCode( "4k24" ), IVideoStandard::EHD_3840_2160P_2400 },
  VModeRow{ FourCharacterCode( "4k25" ), IVideoStandard::EHD_3840_2160P_2500 },
  VModeRow{ FourCharacterCode( "4k29" ), IVideoStandard::EHD_3840_2160P_2997 },
  VModeRow{ FourCharacterCode( "4k30" ), IVideoStandard::EHD_3840_2160P_3000 },
  VModeRow{ FourCharacterCode( "4k50" ), IVideoStandard::EHD_3840_2160P_5000 },
  VModeRow{ FourCharacterCode( "4k59" ), IVideoStandard::EHD_3840_2160P_5994 },
  VModeRow{ FourCharacterCode( "4k60" ), IVideoStandard::EHD_3840_2160P_6000 },
  VModeRow{ FourCharacterCode( "4d23" ), IVideoStandard::EHD_4096_2160P_2398 },
  VModeRow{ FourCharacterCode( "4d24" ), IVideoStandard::EHD_4096_2160P_2400 },
  VModeRow{ FourCharacterCode( "4d25" ), IVideoStandard::EHD_4096_2160P_2500 },
};
static_assert( Modes.size() == 36 );

struct VPixelFormatRow
{
  IPixelFormat::Enum m_Format;
  uint32_t m_VendorFormat;
};

constexpr std::array PixelFormats = {
  VPixelFormatRow{ IPixelFormat::EU8Y8V8Y8, DeckLinkAPI::PixelFormat::YUV8Bit },
  VPixelFormatRow{ IPixelFormat::EB8G8R8u8, DeckLinkAPI::PixelFormat::BGRA8Bit },
  VPixelFormatRow{ IPixelFormat::EU10Y10V10Y10, DeckLinkAPI::PixelFormat::YUV10Bit },
};

void LogUnsupportedPixelFormat() { KVZ_LOG( "VideoInputDeviceBlackmagic", 2, "Unsupported pixel format." ); }

}

IVideoStandard::Enum ToVideoStandard( uint32_t i_DisplayMode )
{
  const auto Found = std::find_if( Modes.begin(), Modes.end(), [i_DisplayMode]( const VModeRow& i_rRow ) { return i_rRow.m_Mode == i_DisplayMode; } );
  if( Found == Modes.end() )
  {
    KVZ_LOG( "VideoInputDeviceBlackmagic", 2, "Unsupported video mode." );
    return IVideoStandard::EUnspecified;
  }
  return Found->m_Standard;
}

uint32_t ToVendorPixelFormat( IPixelFormat::Enum i_PixelFormat )
{
  for( const VPixelFormatRow& rRow : PixelFormats )
  {
    if( rRow.m_Format == i_PixelFormat )
    {
      return rRow.m_VendorFormat;
    }
  }
  LogUnsupportedPixelFormat();
  return 0;
}

IPixelFormat::Enum ToPixelFormat( uint32_t i_VendorPixelFormat )
{
  for( const VPixelFormatRow& rRow : PixelFormats )
  {
    if( rRow.m_VendorFormat == i_VendorPixelFormat )
    {
      return rRow.m_Format;
    }
  }
  LogUnsupportedPixelFormat();
  return IPixelFormat::ELuminance8;
}

uint32_t ToVendorSampleType( KVZ::IAudioSampleFormat::Enum i_Format )
{
  return i_Format == KVZ::IAudioSampleFormat::EInt32 ? DeckLinkAPI::AudioSampleType::Int32 : DeckLinkAPI::AudioSampleType::Int16;
}

uint32_t ToVendorSampleRate( uint32_t i_SampleRate )
{
  if( i_SampleRate != DeckLinkAPI::AudioSampleRate48kHz )
  {
    KVZ_LOG( "VideoInputDeviceBlackmagic", 2, "Unsupported sample rate %d", i_SampleRate );
  }
  return DeckLinkAPI::AudioSampleRate48kHz;
}

}
