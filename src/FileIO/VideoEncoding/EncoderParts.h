// What a frame encoder works with and does not contain: pixel format converters, compressors, the drawing of text.
//
// The composing place fills the process-wide record once, before the first encoder is made; an encoder takes its own copy.
#pragma once

#include "CoreVideoUtils/IPixelFormatConverter.h"
#include "Utils/UtilsMemory/ByteVector.h"

#include <functional>
#include <map>
#include <memory>
#include <string>

namespace VideoEncoding
{

// Which converter an encoder is made with. A writer that makes its own encoder takes the software one.
enum class EConverter : int32_t
{
  OpenGLFirst = 1,
  Software = 2,
  OpenGLSecond = 3,   // and any other value
};

struct VBurnInSettings
{
  std::string m_Text;   // empty: nothing is drawn
  uint32_t m_X = 0;     // pixels from the image's left and upper edge
  uint32_t m_Y = 0;
  uint32_t m_SizeIndex = 2;   // one of the five fonts
};

struct VCompressionInput
{
  const KVZ::VideoFrameInfo& m_rInfo;
  const uint8_t* m_pPixels;
  size_t m_Size;
  int m_JPEGQuality;   // 1 to 100
};
// Compresses one image into o_rOutput, using the scratch vector for what it needs in between. False if it could not. Any thread, several at
// once.
using VCompressor = std::function<bool( const VCompressionInput&, UtilsMemory::VByteVector& o_rOutput, UtilsMemory::VByteVector& io_rScratch )>;

using VConverterMaker = std::function<std::shared_ptr<KVZ::IPixelFormatConverter>()>;

// Draws into an image of the given description. False if it could not. Any thread, several at once.
using VTextDrawer =
  std::function<bool( KVZ::IPixelFormatConverter&, const KVZ::VideoFrameInfo&, const VBurnInSettings&, uint8_t* io_pPixels, size_t i_Size )>;

struct VEncoderParts
{
  std::map<EConverter, VConverterMaker> m_ConverterMakers;
  std::map<KVZ::IVideoPayload::Enum, VCompressor> m_Compressors;
  VTextDrawer m_DrawText;
};

// The process-wide record.
VEncoderParts& DefaultEncoderParts();

}
