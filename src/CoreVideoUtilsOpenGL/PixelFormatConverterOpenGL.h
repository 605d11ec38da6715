// Converts pixel formats on the graphics card: a frame becomes a texture, is drawn on a mesh into a framebuffer, and is read back. The only
// converter that undoes the distortion of a lens, and that turns images that are stored bottom-up.
//
// From every pixel format to Luminance8, R8G8B8, B8G8R8, R8G8B8u8 and B8G8R8u8. A fourth byte is 127 or 128. Luminance8 is the mean of red, green
// and blue, rounded, whatever the source. What the lens correction moves into the image from outside is black.
#pragma once

#include "CoreVideoUtils/IPixelFormatConverter.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <atomic>
#include <functional>
#include <memory>
#include <string>

namespace CoreVideoUtilsOpenGL
{

class VGraphicsThreadUse;

// What is drawn. Where the machine has no usable OpenGL, which is found out at the first conversion and said in the log, both give what the
// software converter does.
enum class EUse
{
  Always,     // every conversion; one that OpenGL cannot do fails, as does one that finds its context lost: the next one makes a new context
  LensAlone   // what has a lens to correct, where OpenGL can; all else is done in software, which is faster with its way to memory and back
};

// A conversion's parts, for those who measure them.
enum class EStep
{
  Prepared,   // the frame's bytes are laid out as a texture
  Uploaded,
  Drawn,
  ReadBack
};

// Any thread, several conversions at once: they run one after the other, on a thread of their own, and callers wait for the result. The first
// conversion makes the OpenGL context.
class VPixelFormatConverterOpenGL : public KVZ::IPixelFormatConverter
{
public:
  struct VSettings
  {
    EUse m_Use = EUse::Always;
    std::string m_ShaderRoot = ":";            // what the folders of shaders lie in: the module's own resources, or a folder on the disk
    std::function<void( EStep )> m_OnStep{};   // called when the graphics card has done this step, which takes longer so
  };

  explicit VPixelFormatConverterOpenGL( VSettings i_Settings );
  // No conversion is running.
  ~VPixelFormatConverterOpenGL() override;

  bool Convert( const KVZ::VideoFrameInfo& i_rSourceInfo, const uint8_t* i_pSource, size_t i_SourceSize, KVZ::IPixelFormat::Enum i_Target,
    uint8_t* o_pTarget, size_t i_TargetSize ) override;
  // For Bayer images.
  void SetColourCorrection( const KVZ::VColourRecord& i_rColour ) override;
  // The centre is in pixels of the image; one at (0, 0) corrects nothing, as does a model that is not known.
  void SetLensCorrection( const KVZ::VLensDistortionRecord& i_rLens ) override;
  void SetLensCorrectionEnabled( bool i_bEnabled ) override;

private:
  class VImpl;
  struct VFrame;
  enum class EResult;

  VFrame MakeFrame() const;
  EResult Draw( const VFrame& i_rFrame );
  void DrawOnThread( const VFrame& i_rFrame, EResult& o_rResult );
  bool ConvertInSoftware( const VFrame& i_rFrame );
  VGraphicsThreadUse& Thread();

  const VSettings m_Settings;
  CoreVideoUtils::VPixelFormatConverter m_Software;
  std::atomic<bool> m_bUnusable{ false };

  mutable boost::mutex m_Mutex;
  KVZ::VColourRecord m_Colour GUARDED_BY( m_Mutex );
  KVZ::VLensDistortionRecord m_Lens GUARDED_BY( m_Mutex );
  bool m_bLensEnabled GUARDED_BY( m_Mutex ) = false;
  std::unique_ptr<VGraphicsThreadUse> m_pThread GUARDED_BY( m_Mutex );   // empty before the first conversion

  std::unique_ptr<VImpl> m_pImpl;   // the graphics thread's
};

}
