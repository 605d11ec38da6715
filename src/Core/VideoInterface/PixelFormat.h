// Pixel layouts of captured and stored frames. Values are stored in settings, names in files.
#pragma once

#include <cstdint>
#include <string>

namespace KVZ
{

class IPixelFormat
{
public:
  enum Enum : int32_t
  {
    EUnspecified = 0,
    ELuminance8 = 1,
    EBayerRG8 = 2,   // first row red, green
    EBayerGB8 = 3,   // first row green, blue
    EBayerGR8 = 4,   // first row green, red
    EBayerBG8 = 5,   // first row blue, green
    ER5G6B5 = 6,
    ER8G8B8 = 7,
    EB8G8R8 = 8,
    ER8G8B8u8 = 9,
    EB8G8R8u8 = 10,
    EU8Y8V8Y8 = 11,   // 4:2:2, two pixels in four bytes
    EY8U8Y8V8 = 12,
    EU10Y10V10Y10 = 13,   // 4:2:2 10 bit, 48 pixels in 128 bytes, rows padded to whole groups
    EBayerGB7 = 14,       // 7 bits a pixel, packed
    EBayerGB6 = 15,       // 6 bits a pixel, packed
    ELuminance7 = 16,
    ELuminance6 = 17,
  };
};

constexpr int32_t PixelFormatCount = 18;

// Bytes of an image. U10Y10V10Y10 rows are padded to whole groups of 48 pixels; the packed 7 and 6 bit forms round up once a frame.
// 0 for "Unspecified" and for a value outside the table.
uint64_t GetImageSize( IPixelFormat::Enum i_Format, uint32_t i_Width, uint32_t i_Height );

// The enumerator's name; empty for a value outside the table.
std::string ToName( IPixelFormat::Enum i_Value );
bool FromName( const std::string& i_rName, IPixelFormat::Enum& o_rValue );

}
