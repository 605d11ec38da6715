// How a frame of each pixel format reaches the texture, and which program draws it.
//
// 8-bit formats go as they are, but for 4:2:2. Packed ones of 7, 6 and 5 bits are spread to bytes first, as the software converter does, and those
// with colour differences, of eight and ten bits, to 16: code 4n of ten bits stands where code n of eight does, and the middle of a colour
// difference, 128 or 512, at one half, where the shader looks for it.
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

// What textures can be here. Those of OpenGL ES have no more than eight bits without an extension: ten are cut to eight then, and 128 lies at
// 128 / 255.
struct VTextureKinds
{
  bool m_bSized = true;   // internal formats tell the bits
  bool m_b16Bits = true;
};

// i_pSource holds the whole image; its width and height are not 0.
VUpload PrepareUpload( const KVZ::VideoFrameInfo& i_rInfo, const uint8_t* i_pSource, const VTextureKinds& i_rKinds,
  std::vector<uint8_t>& io_rScratch );

}
