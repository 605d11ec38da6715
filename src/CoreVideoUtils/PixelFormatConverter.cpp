#include "CoreVideoUtils/PixelFormatConverter.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>

namespace CoreVideoUtils
{

namespace
{

// Frame encoders set these once a frame, so the message is one for those who look closely.
void LogLensCorrection() { KVZ_LOG_DETAIL( "CoreVideoUtils", "Lens distortion correction not supported in software converter." ); }

}

bool VPixelFormatConverter::Convert( const KVZ::VideoFrameInfo& i_rSourceInfo, const uint8_t* i_pSource, size_t i_SourceSize,
  KVZ::IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_TargetSize )
{
  const uint64_t SourceSize = KVZ::GetImageSize( i_rSourceInfo.m_PixelFormat, i_rSourceInfo.m_ImageWidth, i_rSourceInfo.m_ImageHeight );
  const uint64_t TargetSize = KVZ::GetImageSize( i_Target, i_rSourceInfo.m_ImageWidth, i_rSourceInfo.m_ImageHeight );
  if( i_SourceSize < SourceSize || i_TargetSize < TargetSize )
  {
    return false;
  }
  if( i_rSourceInfo.m_PixelFormat == i_Target )
  {
    std::copy_n( i_pSource, SourceSize, o_pTarget );
    return true;
  }
  return false;
}

void VPixelFormatConverter::SetColourCorrection( const KVZ::VColourRecord& i_rColour )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_ColourCorrector.SetColourCorrection( i_rColour );
}

void VPixelFormatConverter::SetLensCorrection( const KVZ::VLensDistortionRecord& ) { LogLensCorrection(); }

void VPixelFormatConverter::SetLensCorrectionEnabled( bool ) { LogLensCorrection(); }

VColourCorrector VPixelFormatConverter::ColourCorrector() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_ColourCorrector;
}

}
