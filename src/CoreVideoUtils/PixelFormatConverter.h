// Converts pixel formats in software.
//
// Every format that there is becomes R8G8B8, B8G8R8, R8G8B8u8 or B8G8R8u8, and U8Y8V8Y8; which others there are stands in one table in the
// .cpp. Rows stay in their order, whatever the description says about inversion. An unused fourth byte is written as 255.
#pragma once

#include "CoreVideoUtils/ColourCorrector.h"
#include "CoreVideoUtils/IPixelFormatConverter.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

namespace CoreVideoUtils
{

// Any thread, several conversions at once: each works with the colour correction as it stood when it began.
class VPixelFormatConverter : public KVZ::IPixelFormatConverter
{
public:
  // False for a pair that is not in the table and for buffers below the images' sizes; longer ones will do, but for a Bayer image's way to
  // Luminance8, where the target has exactly its size. The buffers do not overlap. Equal formats are copied.
  bool Convert( const KVZ::VideoFrameInfo& i_rSourceInfo, const uint8_t* i_pSource, size_t i_SourceSize, KVZ::IPixelFormat::Enum i_Target,
    uint8_t* o_pTarget, size_t i_TargetSize ) override;

  // Applied to what becomes of Bayer images in R8G8B8, B8G8R8, R8G8B8u8 and B8G8R8u8. Equal values again cost nothing.
  void SetColourCorrection( const KVZ::VColourRecord& i_rColour ) override;

  // Not supported: both log and change nothing.
  void SetLensCorrection( const KVZ::VLensDistortionRecord& i_rLens ) override;
  void SetLensCorrectionEnabled( bool i_bEnabled ) override;

private:
  VColourCorrector ColourCorrector() const;

  mutable boost::mutex m_Mutex;
  VColourCorrector m_ColourCorrector GUARDED_BY( m_Mutex );
};

}
