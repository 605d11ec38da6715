#include "Core/VideoInterface/VideoStandard.h"

#include "Core/VideoInterface/Schemas.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <array>

namespace KVZ
{

namespace
{

constexpr std::array Standards = {
  VVideoStandardRow{ IVideoStandard::ESD_720_486I_5994, "SD_720_486I_5994", 720, 486, EScan::Interlaced, 30000, 1001, 4504500 },
  VVideoStandardRow{ IVideoStandard::ESD_720_486P_2398, "SD_720_486P_2398", 720, 486, EScan::Progressive, 24000, 1001, 5630625 },
  VVideoStandardRow{ IVideoStandard::ESD_720_486P_5994, "SD_720_486P_5994", 720, 486, EScan::Progressive, 60000, 1001, 2252250 },
  VVideoStandardRow{ IVideoStandard::ESD_720_576I_5000, "SD_720_576I_5000", 720, 576, EScan::Interlaced, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::ESD_720_576P_5000, "SD_720_576P_5000", 720, 576, EScan::Progressive, 50, 1, 2700000 },
  VVideoStandardRow{ IVideoStandard::EHD_1280_720P_2398, "HD_1280_720P_2398", 1280, 720, EScan::Progressive, 24000, 1001, 5630625 },
  VVideoStandardRow{ IVideoStandard::EHD_1280_720P_2400, "HD_1280_720P_2400", 1280, 720, EScan::Progressive, 24, 1, 5625000 },
  VVideoStandardRow{ IVideoStandard::EHD_1280_720P_2500, "HD_1280_720P_2500", 1280, 720, EScan::Progressive, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::EHD_1280_720P_2997, "HD_1280_720P_2997", 1280, 720, EScan::Progressive, 30000, 1001, 4504500 },
  VVideoStandardRow{ IVideoStandard::EHD_1280_720P_3000, "HD_1280_720P_3000", 1280, 720, EScan::Progressive, 30, 1, 4500000 },
  VVideoStandardRow{ IVideoStandard::EHD_1280_720P_5000, "HD_1280_720P_5000", 1280, 720, EScan::Progressive, 50, 1, 2700000 },
  VVideoStandardRow{ IVideoStandard::EHD_1280_720P_5994, "HD_1280_720P_5994", 1280, 720, EScan::Progressive, 60000, 1001, 2252250 },
  VVideoStandardRow{ IVideoStandard::EHD_1280_720P_6000, "HD_1280_720P_6000", 1280, 720, EScan::Progressive, 60, 1, 2250000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080I_5000, "HD_1920_1080I_5000", 1920, 1080, EScan::Interlaced, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080I_5994, "HD_1920_1080I_5994", 1920, 1080, EScan::Interlaced, 30000, 1001, 4504500 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080I_6000, "HD_1920_1080I_6000", 1920, 1080, EScan::Interlaced, 30, 1, 4500000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080P_2398, "HD_1920_1080P_2398", 1920, 1080, EScan::Progressive, 24000, 1001, 5630625 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080P_2400, "HD_1920_1080P_2400", 1920, 1080, EScan::Progressive, 24, 1, 5625000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080P_2500, "HD_1920_1080P_2500", 1920, 1080, EScan::Progressive, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080P_2997, "HD_1920_1080P_2997", 1920, 1080, EScan::Progressive, 30000, 1001, 4504500 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080P_3000, "HD_1920_1080P_3000", 1920, 1080, EScan::Progressive, 30, 1, 4500000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080P_4800, "HD_1920_1080P_4800", 1920, 1080, EScan::Progressive, 48, 1, 2812500 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080P_5000, "HD_1920_1080P_5000", 1920, 1080, EScan::Progressive, 50, 1, 2700000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080P_5994, "HD_1920_1080P_5994", 1920, 1080, EScan::Progressive, 60000, 1001, 2252250 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080P_6000, "HD_1920_1080P_6000", 1920, 1080, EScan::Progressive, 60, 1, 2250000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080PSF_2398, "HD_1920_1080PSF_2398", 1920, 1080, EScan::SegmentedFrame, 24000, 1001, 5630625 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080PSF_2400, "HD_1920_1080PSF_2400", 1920, 1080, EScan::SegmentedFrame, 24, 1, 5625000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080PSF_2500, "HD_1920_1080PSF_2500", 1920, 1080, EScan::SegmentedFrame, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080PSF_2997, "HD_1920_1080PSF_2997", 1920, 1080, EScan::SegmentedFrame, 30000, 1001, 4504500 },
  VVideoStandardRow{ IVideoStandard::EHD_1920_1080PSF_3000, "HD_1920_1080PSF_3000", 1920, 1080, EScan::SegmentedFrame, 30, 1, 4500000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1556P_2398, "HD_2048_1556P_2398", 2048, 1556, EScan::Progressive, 24000, 1001, 5630625 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1556P_2400, "HD_2048_1556P_2400", 2048, 1556, EScan::Progressive, 24, 1, 5625000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1556P_2500, "HD_2048_1556P_2500", 2048, 1556, EScan::Progressive, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1556PSF_1498, "HD_2048_1556PSF_1498", 2048, 1556, EScan::SegmentedFrame, 0, 1, 0 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1556PSF_1500, "HD_2048_1556PSF_1500", 2048, 1556, EScan::SegmentedFrame, 0, 1, 0 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080P_2398, "HD_2048_1080P_2398", 2048, 1080, EScan::Progressive, 24000, 1001, 5630625 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080P_2400, "HD_2048_1080P_2400", 2048, 1080, EScan::Progressive, 24, 1, 5625000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080P_2500, "HD_2048_1080P_2500", 2048, 1080, EScan::Progressive, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080P_2997, "HD_2048_1080P_2997", 2048, 1080, EScan::Progressive, 30000, 1001, 4504500 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080P_3000, "HD_2048_1080P_3000", 2048, 1080, EScan::Progressive, 30, 1, 4500000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080P_4800, "HD_2048_1080P_4800", 2048, 1080, EScan::Progressive, 48, 1, 2812500 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080P_5000, "HD_2048_1080P_5000", 2048, 1080, EScan::Progressive, 50, 1, 2700000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080P_5994, "HD_2048_1080P_5994", 2048, 1080, EScan::Progressive, 60000, 1001, 2252250 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080P_6000, "HD_2048_1080P_6000", 2048, 1080, EScan::Progressive, 60, 1, 2250000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080PSF_2398, "HD_2048_1080PSF_2398", 2048, 1080, EScan::SegmentedFrame, 24000, 1001, 5630625 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080PSF_2400, "HD_2048_1080PSF_2400", 2048, 1080, EScan::SegmentedFrame, 24, 1, 5625000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080PSF_2500, "HD_2048_1080PSF_2500", 2048, 1080, EScan::SegmentedFrame, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080PSF_2997, "HD_2048_1080PSF_2997", 2048, 1080, EScan::SegmentedFrame, 30000, 1001, 4504500 },
  VVideoStandardRow{ IVideoStandard::EHD_2048_1080PSF_3000, "HD_2048_1080PSF_3000", 2048, 1080, EScan::SegmentedFrame, 30, 1, 4500000 },
  VVideoStandardRow{ IVideoStandard::EHD_3840_2160P_2398, "HD_3840_2160P_2398", 3840, 2160, EScan::Progressive, 24000, 1001, 5630625 },
  VVideoStandardRow{ IVideoStandard::EHD_3840_2160P_2400, "HD_3840_2160P_2400", 3840, 2160, EScan::Progressive, 24, 1, 5625000 },
  VVideoStandardRow{ IVideoStandard::EHD_3840_2160P_2500, "HD_3840_2160P_2500", 3840, 2160, EScan::Progressive, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::EHD_3840_2160P_2997, "HD_3840_2160P_2997", 3840, 2160, EScan::Progressive, 30000, 1001, 4504500 },
  VVideoStandardRow{ IVideoStandard::EHD_3840_2160P_3000, "HD_3840_2160P_3000", 3840, 2160, EScan::Progressive, 30, 1, 4500000 },
  VVideoStandardRow{ IVideoStandard::EHD_3840_2160P_5000, "HD_3840_2160P_5000", 3840, 2160, EScan::Progressive, 50, 1, 2700000 },
  VVideoStandardRow{ IVideoStandard::EHD_3840_2160P_5994, "HD_3840_2160P_5994", 3840, 2160, EScan::Progressive, 60000, 1001, 2252250 },
  VVideoStandardRow{ IVideoStandard::EHD_3840_2160P_6000, "HD_3840_2160P_6000", 3840, 2160, EScan::Progressive, 60, 1, 2250000 },
  VVideoStandardRow{ IVideoStandard::EHD_4096_2160P_2398, "HD_4096_2160P_2398", 4096, 2160, EScan::Progressive, 24000, 1001, 5630625 },
  VVideoStandardRow{ IVideoStandard::EHD_4096_2160P_2400, "HD_4096_2160P_2400", 4096, 2160, EScan::Progressive, 24, 1, 5625000 },
  VVideoStandardRow{ IVideoStandard::EHD_4096_2160P_2500, "HD_4096_2160P_2500", 4096, 2160, EScan::Progressive, 25, 1, 5400000 },
  VVideoStandardRow{ IVideoStandard::EUnspecified, "Unspecified", 0, 0, EScan::None, 0, 1, 0 },
};
static_assert( Standards.size() == VideoStandardCount );

constexpr bool IsIndexedByValue()
{
  for( size_t Index = 0; Index < Standards.size(); ++Index )
  {
    if( Standards[Index].m_Standard != static_cast<int32_t>( Index ) )
    {
      return false;
    }
  }
  return true;
}
static_assert( IsIndexedByValue() );

constexpr auto EnumRows = []
{
  std::array<VEnumRow, Standards.size()> Rows{};
  for( size_t Index = 0; Index < Rows.size(); ++Index )
  {
    Rows[Index] = VEnumRow{ Standards[Index].m_Standard, Standards[Index].m_pName };
  }
  return Rows;
}();

constexpr VEnumTable Table{ "VideoStandard.Enum", "Enumeration.", EnumRows };

// Devices call a segmented frame not interlaced, and know no scan for progressive SD and for the 2K film rasters.
bool IsProgressiveWithoutScan( const VVideoStandardRow& i_rRow )
{
  return i_rRow.m_Scan == EScan::Progressive && ( i_rRow.m_Height == 486 || i_rRow.m_Height == 576 || i_rRow.m_Height == 1556 );
}

}

const VEnumTable& GetEnumTable( IVideoStandard::Enum ) { return Table; }

const VVideoStandardRow* FindVideoStandard( IVideoStandard::Enum i_Standard )
{
  const bool bKnown = i_Standard >= 0 && i_Standard < VideoStandardCount;
  return bKnown ? &Standards[i_Standard] : nullptr;
}

int64_t GetFramePeriod( IVideoStandard::Enum i_Standard )
{
  const VVideoStandardRow* pRow = FindVideoStandard( i_Standard );
  return pRow ? pRow->m_Period : 0;
}

IInterlacedFormat::Enum GetInterlacedFormat( IVideoStandard::Enum i_Standard )
{
  const VVideoStandardRow* pRow = FindVideoStandard( i_Standard );
  if( !pRow || pRow->m_Scan == EScan::None || IsProgressiveWithoutScan( *pRow ) )
  {
    KVZ_LOG_ERROR( "VideoCaptureDevice", "Invalid video standard." );
    return IInterlacedFormat::EUnspecified;
  }
  return pRow->m_Scan == EScan::Interlaced ? IInterlacedFormat::EInterlacedFrameUnspecifiedLineTiming : IInterlacedFormat::ENotInterlaced;
}

std::string ToName( IVideoStandard::Enum i_Standard ) { return FindName( Table, i_Standard ); }

bool FromName( const std::string& i_rName, IVideoStandard::Enum& o_rStandard ) { return FindEnumerator( Table, i_rName, o_rStandard ); }

}
