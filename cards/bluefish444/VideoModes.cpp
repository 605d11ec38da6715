#include "cards/bluefish444/VideoModes.h"

#include "VendorInterfaces/BlueVelvet.h"
#include "cards/common/PixelRow.h"

#include <algorithm>
#include <array>

namespace VirtualCards
{

namespace
{

using KVZ::IPixelFormat;
using KVZ::IVideoStandard;
namespace Format = BlueVelvet::MemoryFormat;

struct VModeRow
{
  uint32_t m_Mode;
  IVideoStandard::Enum m_Standard;
};

constexpr std::array Modes = {
  VModeRow{ 0, IVideoStandard::ESD_720_576I_5000 },
  VModeRow{ 1, IVideoStandard::ESD_720_486I_5994 },
  VModeRow{ 2, IVideoStandard::EHD_1280_720P_5994 },
  VModeRow{ 3, IVideoStandard::EHD_1280_720P_6000 },
  VModeRow{ 4, IVideoStandard::EHD_1920_1080PSF_2398 },
  VModeRow{ 5, IVideoStandard::EHD_1920_1080PSF_2400 },
  VModeRow{ 6, IVideoStandard::EHD_1920_1080P_2398 },
  VModeRow{ 7, IVideoStandard::EHD_1920_1080P_2400 },
  VModeRow{ 8, IVideoStandard::EHD_1920_1080I_5000 },
  VModeRow{ 9, IVideoStandard::EHD_1920_1080I_5994 },
  VModeRow{ 10, IVideoStandard::EHD_1920_1080I_6000 },
  VModeRow{ 11, IVideoStandard::EHD_1920_1080P_2500 },
  VModeRow{ 12, IVideoStandard::EHD_1920_1080P_2997 },
  VModeRow{ 13, IVideoStandard::EHD_1920_1080P_3000 },
  VModeRow{ 16, IVideoStandard::EHD_1280_720P_5000 },
  VModeRow{ 17, IVideoStandard::EHD_1280_720P_2398 },
  VModeRow{ 18, IVideoStandard::EHD_1280_720P_2400 },
  VModeRow{ 19, IVideoStandard::EHD_2048_1080PSF_2398 },
  VModeRow{ 20, IVideoStandard::EHD_2048_1080PSF_2400 },
  VModeRow{ 21, IVideoStandard::EHD_2048_1080P_2398 },
  VModeRow{ 22, IVideoStandard::EHD_2048_1080P_2400 },
  VModeRow{ 23, IVideoStandard::EHD_1920_1080PSF_2500 },
  VModeRow{ 24, IVideoStandard::EHD_1920_1080PSF_2997 },
  VModeRow{ 25, IVideoStandard::EHD_1920_1080PSF_3000 },
  VModeRow{ 26, IVideoStandard::EHD_1920_1080P_5000 },
  VModeRow{ 27, IVideoStandard::EHD_1920_1080P_5994 },
  VModeRow{ 28, IVideoStandard::EHD_1920_1080P_6000 },
  VModeRow{ 29, IVideoStandard::EHD_1280_720P_2500 },
  VModeRow{ 30, IVideoStandard::EHD_1280_720P_2997 },
  VModeRow{ 31, IVideoStandard::EHD_1280_720P_3000 },
  VModeRow{ 33, IVideoStandard::EHD_2048_1080PSF_2500 },
  VModeRow{ 34, IVideoStandard::EHD_2048_1080PSF_2997 },
  VModeRow{ 35, IVideoStandard::EHD_2048_1080PSF_3000 },
  VModeRow{ 36, IVideoStandard::EHD_2048_1080P_2500 },
  VModeRow{ 37, IVideoStandard::EHD_2048_1080P_2997 },
  VModeRow{ 38, IVideoStandard::EHD_2048_1080P_3000 },
  VModeRow{ 39, IVideoStandard::EHD_2048_1080P_5000 },
  VModeRow{ 40, IVideoStandard::EHD_2048_1080P_5994 },
  VModeRow{ 41, IVideoStandard::EHD_2048_1080P_6000 },
  VModeRow{ 42, IVideoStandard::EHD_1920_1080P_4800 },
  VModeRow{ 43, IVideoStandard::EHD_2048_1080P_4800 },
};
static_assert( Modes.size() == 41 );

struct VFormatRow
{
  uint32_t m_MemoryFormat;
  IPixelFormat::Enum m_PixelFormat;
};

// Nobody has published what a card puts into memory as YUVAlpha; here it is luma alone.
constexpr std::array Formats = {
  VFormatRow{ Format::BV8, IPixelFormat::EY8U8Y8V8 },
  VFormatRow{ Format::V210, IPixelFormat::EU10Y10V10Y10 },
  VFormatRow{ Format::RGBA, IPixelFormat::ER8G8B8u8 },
  VFormatRow{ Format::ARGBPC, IPixelFormat::EB8G8R8u8 },
  VFormatRow{ Format::TwoVUY, IPixelFormat::EU8Y8V8Y8 },
  VFormatRow{ Format::BGR, IPixelFormat::EB8G8R8 },
  VFormatRow{ Format::RGB, IPixelFormat::ER8G8B8 },
  VFormatRow{ Format::YUVAlpha, IPixelFormat::ELuminance8 },
};

constexpr uint32_t PageBytes = 4096;

}

uint32_t ModeOf( IVideoStandard::Enum i_Standard )
{
  const auto Found = std::find_if( Modes.begin(), Modes.end(), [&]( const VModeRow& i_r ) { return i_r.m_Standard == i_Standard; } );
  return Found != Modes.end() ? Found->m_Mode : NoSignalMode;
}

const KVZ::VVideoStandardRow* StandardOf( uint32_t i_Mode )
{
  const auto Found = std::find_if( Modes.begin(), Modes.end(), [&]( const VModeRow& i_r ) { return i_r.m_Mode == i_Mode; } );
  return Found != Modes.end() ? KVZ::FindVideoStandard( Found->m_Standard ) : nullptr;
}

IPixelFormat::Enum PixelFormatOf( uint32_t i_MemoryFormat )
{
  const auto Found = std::find_if( Formats.begin(), Formats.end(), [&]( const VFormatRow& i_r ) { return i_r.m_MemoryFormat == i_MemoryFormat; } );
  return Found != Formats.end() ? Found->m_PixelFormat : IPixelFormat::EUnspecified;
}

VModeSizes SizesOf( uint32_t i_Mode, uint32_t i_MemoryFormat, uint32_t i_UpdateMethod )
{
  const KVZ::VVideoStandardRow* pStandard = StandardOf( i_Mode );
  const IPixelFormat::Enum PixelFormat = PixelFormatOf( i_MemoryFormat );
  if( !pStandard || PixelFormat == IPixelFormat::EUnspecified )
  {
    return {};
  }
  const bool bField = i_UpdateMethod == BlueVelvet::UpdateMethod::Field && pStandard->m_Scan == KVZ::EScan::Interlaced;
  VModeSizes Sizes;
  Sizes.m_Width = pStandard->m_Width;
  Sizes.m_Lines = pStandard->m_Height / ( bField ? 2 : 1 );
  Sizes.m_LineBytes = RowBytes( PixelFormat, pStandard->m_Width );
  Sizes.m_Bytes = Sizes.m_LineBytes * Sizes.m_Lines;
  Sizes.m_GoldenBytes = ( Sizes.m_Bytes + PageBytes - 1 ) / PageBytes * PageBytes;
  return Sizes;
}

}
