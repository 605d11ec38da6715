// How a frame of each pixel format reaches the texture, and which program draws it.
//
// 8-bit formats go as they are. Packed ones of 7, 6 and 5 bits are spread to bytes first, as the software converter does, and ten bits to 16:
// code 4n stands where code n of eight bits does, and the middle of a colour difference, 512, at exactly one half.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "CoreGraphics/VideoTexture.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace CoreVideoUtilsOpenGL
{

enum class EProgram : size_t
{
  Raw,
  Bayer,
  Luminance,
  YUV
};
constexpr size_t ProgramCount = 4;

// What is fixed by the pixel format.
struct VSourceFormat
{
  KVZ::IPixelFormat::Enum m_Format;
  EProgram m_Program;
  bool m_bSwizzle = false;                // blue before red; a colour difference before its luma
  std::array<float, 2> m_FirstRed = {};   // column and row of a Bayer image's first red pixel
};

// Null for a format that no program takes.
const VSourceFormat* FindSourceFormat( KVZ::IPixelFormat::Enum i_Format );

struct VUpload
{
  VideoGraphics::VTextureLayout m_Layout;
  const uint8_t* m_pPixels = nullptr;       // the frame's own bytes, or those of the scratch vector
  std::array<float, 2> m_Resolution = {};   // pixels that the texture has room for
  std::array<float, 2> m_Scale = {};        // the part of them that is the image
};

// i_pSource holds the whole image; its width and height are not 0. Textures of OpenGL ES 2.0 have no more than eight bits.
VUpload PrepareUpload( const KVZ::VideoFrameInfo& i_rInfo, const uint8_t* i_pSource, bool i_bOpenGLES, std::vector<uint8_t>& io_rScratch );

}
