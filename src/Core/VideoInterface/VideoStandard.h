// The video standards that a capture device can report. Values are stored in settings and files and never change.
//
// The name carries width, height, scan and rate: an interlaced name gives fields a second, the others frames a second.
// Any thread may call these functions. The look-ups neither allocate nor throw; only a name, and a line in the log, takes memory.
#pragma once

#include "Core/VideoInterface/InterlacedFormat.h"

#include <cstdint>
#include <string>

namespace KVZ
{

class IVideoStandard
{
public:
  enum Enum : int32_t
  {
    ESD_720_486I_5994 = 0,
    ESD_720_486P_2398 = 1,
    ESD_720_486P_5994 = 2,
    ESD_720_576I_5000 = 3,
    ESD_720_576P_5000 = 4,
    EHD_1280_720P_2398 = 5,
    EHD_1280_720P_2400 = 6,
    EHD_1280_720P_2500 = 7,
    EHD_1280_720P_2997 = 8,
    EHD_1280_720P_3000 = 9,
    EHD_1280_720P_5000 = 10,
    EHD_1280_720P_5994 = 11,
    EHD_1280_720P_6000 = 12,
    EHD_1920_1080I_5000 = 13,
    EHD_1920_1080I_5994 = 14,
    EHD_1920_1080I_6000 = 15,
    EHD_1920_1080P_2398 = 16,
    EHD_1920_1080P_2400 = 17,
    EHD_1920_1080P_2500 = 18,
    EHD_1920_1080P_2997 = 19,
    EHD_1920_1080P_3000 = 20,
    EHD_1920_1080P_4800 = 21,
    EHD_1920_1080P_5000 = 22,
    EHD_1920_1080P_5994 = 23,
    EHD_1920_1080P_6000 = 24,
    EHD_1920_1080PSF_2398 = 25,
    EHD_1920_1080PSF_2400 = 26,
    EHD_1920_1080PSF_2500 = 27,
    EHD_1920_1080PSF_2997 = 28,
    EHD_1920_1080PSF_3000 = 29,
    EHD_2048_1556P_2398 = 30,
    EHD_2048_1556P_2400 = 31,
    EHD_2048_1556P_2500 = 32,
    EHD_2048_1556PSF_1498 = 33,
    EHD_2048_1556PSF_1500 = 34,
    EHD_2048_1080P_2398 = 35,
    EHD_2048_1080P_2400 = 36,
    EHD_2048_1080P_2500 = 37,
    EHD_2048_1080P_2997 = 38,
    EHD_2048_1080P_3000 = 39,
    EHD_2048_1080P_4800 = 40,
    EHD_2048_1080P_5000 = 41,
    EHD_2048_1080P_5994 = 42,
    EHD_2048_1080P_6000 = 43,
    EHD_2048_1080PSF_2398 = 44,
    EHD_2048_1080PSF_2400 = 45,
    EHD_2048_1080PSF_2500 = 46,
    EHD_2048_1080PSF_2997 = 47,
    EHD_2048_1080PSF_3000 = 48,
    EHD_3840_2160P_2398 = 49,
    EHD_3840_2160P_2400 = 50,
    EHD_3840_2160P_2500 = 51,
    EHD_3840_2160P_2997 = 52,
    EHD_3840_2160P_3000 = 53,
    EHD_3840_2160P_5000 = 54,
    EHD_3840_2160P_5994 = 55,
    EHD_3840_2160P_6000 = 56,
    EHD_4096_2160P_2398 = 57,
    EHD_4096_2160P_2400 = 58,
    EHD_4096_2160P_2500 = 59,
    EUnspecified = 60,
  };
};

enum class EScan
{
  None,
  Interlaced,
  Progressive,
  SegmentedFrame
};

struct VVideoStandardRow
{
  IVideoStandard::Enum m_Standard;
  const char* m_pName;
  uint32_t m_Width;    // pixels
  uint32_t m_Height;   // lines of a whole frame
  EScan m_Scan;
  uint32_t m_RateNumerator;   // frames a second as a fraction; 0/1 where the standard has no period
  uint32_t m_RateDenominator;
  int64_t m_Period;   // ticks of 1/135000000 s a frame; 0 where the standard has none
};

constexpr int32_t VideoStandardCount = 61;

// The row of a standard, "Unspecified" included; a null pointer for a value outside the table.
const VVideoStandardRow* FindVideoStandard( IVideoStandard::Enum i_Standard );

// Ticks a frame; 0 for a standard without a period and for a value outside the table.
int64_t GetFramePeriod( IVideoStandard::Enum i_Standard );

// What devices write into a frame. Progressive SD and the 2K film rasters are "Unspecified" here and leave a line in the log;
// segmented frames count as not interlaced.
IInterlacedFormat::Enum GetInterlacedFormat( IVideoStandard::Enum i_Standard );

// The enumerator's name; empty for a value outside the table.
std::string ToName( IVideoStandard::Enum i_Standard );
bool FromName( const std::string& i_rName, IVideoStandard::Enum& o_rStandard );

}
