// Turns an image from one pixel format to another. Implementations lie in this folder (software) and beside it (OpenGL).
// Convert may be called from several threads at once, for different images, and beside the setters: each conversion works with the settings
// as they stood when it began. Setting equal values again is cheap. The OpenGL implementation may make its callers wait for each other.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"

#include <cstddef>
#include <cstdint>

namespace KVZ
{

class IPixelFormatConverter
{
public:
  // The description gives the source's width, height and format. False for a pair that is not supported and for sizes below the images'.
  virtual bool Convert( const VideoFrameInfo& i_rSourceInfo, const uint8_t* i_pSource, size_t i_SourceSize, IPixelFormat::Enum i_Target,
    uint8_t* o_pTarget, size_t i_TargetSize ) = 0;
  virtual void SetColourCorrection( const VColourRecord& i_rColour ) = 0;
  virtual void SetLensCorrection( const VLensDistortionRecord& i_rLens ) = 0;
  virtual void SetLensCorrectionEnabled( bool i_bEnabled ) = 0;
  virtual ~IPixelFormatConverter() = default;
};

}
