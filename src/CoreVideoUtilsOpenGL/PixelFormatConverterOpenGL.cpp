#include "CoreVideoUtilsOpenGL/PixelFormatConverterOpenGL.h"

#include "CoreVideoUtilsOpenGL/GraphicsThread.h"
#include "CoreVideoUtilsOpenGL/PixelFormatConverterOpenGLImpl.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>

#include <utility>

// Outside of any namespace, as the macro wants it. The shaders lie in a static library, which nothing else would take them from.
static void RegisterShaders() { Q_INIT_RESOURCE( VideoShaders ); }

namespace CoreVideoUtilsOpenGL
{

VPixelFormatConverterOpenGL::VPixelFormatConverterOpenGL( VSettings i_Settings ) : m_Settings( std::move( i_Settings ) ) { RegisterShaders(); }

VPixelFormatConverterOpenGL::~VPixelFormatConverterOpenGL()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_pThread )
  {
    m_pThread->Run( [this] { m_pImpl.reset(); } );
  }
}

bool VPixelFormatConverterOpenGL::Convert( const KVZ::VideoFrameInfo& i_rSourceInfo, const uint8_t* i_pSource, size_t i_SourceSize,
  KVZ::IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_TargetSize )
{
  VFrame Frame = MakeFrame();
  Frame.m_Source = i_rSourceInfo;
  Frame.m_pSource = i_pSource;
  Frame.m_SourceSize = i_SourceSize;
  Frame.m_Target = i_Target;
  Frame.m_pTarget = o_pTarget;
  Frame.m_TargetSize = i_TargetSize;
  const uint32_t Width = i_rSourceInfo.m_ImageWidth;
  const uint32_t Height = i_rSourceInfo.m_ImageHeight;
  if( i_SourceSize < KVZ::GetImageSize( i_rSourceInfo.m_PixelFormat, Width, Height ) || i_TargetSize < KVZ::GetImageSize( i_Target, Width, Height ) )
  {
    return false;
  }
  if( Width == 0 || Height == 0 || ( m_Settings.m_Use == EUse::LensAlone && Frame.m_Lens.IsOff() ) )
  {
    return ConvertInSoftware( Frame );
  }
  const EResult Result = Draw( Frame );
  const bool bInstead = Result == EResult::NoOpenGL || ( Result != EResult::Done && m_Settings.m_Use == EUse::LensAlone );
  return bInstead ? ConvertInSoftware( Frame ) : Result == EResult::Done;
}

VPixelFormatConverterOpenGL::VFrame VPixelFormatConverterOpenGL::MakeFrame() const
{
  VFrame Frame;
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  Frame.m_Colour = m_Colour;
  Frame.m_bLensEnabled = m_bLensEnabled;
  Frame.m_Lens = m_bLensEnabled ? MakeLens( m_Lens ) : VLens();
  return Frame;
}

VPixelFormatConverterOpenGL::EResult VPixelFormatConverterOpenGL::Draw( const VFrame& i_rFrame )
{
  EResult Result = EResult::NoOpenGL;
  if( !m_bUnusable )
  {
    Thread().Run( [&] { DrawOnThread( i_rFrame, Result ); } );
  }
  return Result;
}

void VPixelFormatConverterOpenGL::DrawOnThread( const VFrame& i_rFrame, EResult& o_rResult )
{
  if( m_bUnusable )
  {
    return;   // a conversion before this one has found that out
  }
  if( !m_pImpl )
  {
    m_pImpl = std::make_unique<VImpl>( m_Settings );
  }
  if( !m_pImpl->WhyUnusable().empty() )
  {
    KVZ_LOG_ERROR( "CoreVideoUtilsOpenGL", "OpenGL cannot be used: %1%. Pixel formats are converted in software.", m_pImpl->WhyUnusable() );
    m_pImpl.reset();
    m_bUnusable = true;
    return;
  }
  o_rResult = m_pImpl->Convert( i_rFrame );
  if( o_rResult == EResult::Lost )
  {
    KVZ_LOG_ERROR( "CoreVideoUtilsOpenGL", "The OpenGL context is lost with a frame to convert. The next frame gets a new one." );
    m_pImpl.reset();
  }
}

bool VPixelFormatConverterOpenGL::ConvertInSoftware( const VFrame& i_rFrame )
{
  if( i_rFrame.m_bLensEnabled )
  {
    KVZ_LOG_ERROR( "CoreVideoUtilsOpenGL", "Lens un-distortion not supported in software conversion." );
  }
  return m_Software.Convert( i_rFrame.m_Source, i_rFrame.m_pSource, i_rFrame.m_SourceSize, i_rFrame.m_Target, i_rFrame.m_pTarget,
    i_rFrame.m_TargetSize );
}

VGraphicsThreadUse& VPixelFormatConverterOpenGL::Thread()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !m_pThread )
  {
    m_pThread = std::make_unique<VGraphicsThreadUse>();
  }
  return *m_pThread;
}

void VPixelFormatConverterOpenGL::SetColourCorrection( const KVZ::VColourRecord& i_rColour )
{
  m_Software.SetColourCorrection( i_rColour );
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Colour = i_rColour;
}

void VPixelFormatConverterOpenGL::SetLensCorrection( const KVZ::VLensDistortionRecord& i_rLens )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Lens = i_rLens;
}

void VPixelFormatConverterOpenGL::SetLensCorrectionEnabled( bool i_bEnabled )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_bLensEnabled = i_bEnabled;
}

}
