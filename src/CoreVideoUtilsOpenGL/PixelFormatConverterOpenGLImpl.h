// The part of the converter that speaks OpenGL. Belongs to the thread that makes it, from beginning to end.
#pragma once

#include "CoreGraphics/Mesh.h"
#include "CoreGraphics/Shader.h"
#include "CoreGraphics/VideoTexture.h"
#include "CoreVideoUtilsOpenGL/FrameUpload.h"
#include "CoreVideoUtilsOpenGL/GraphicsApplication.h"
#include "CoreVideoUtilsOpenGL/LensMesh.h"
#include "CoreVideoUtilsOpenGL/PixelFormatConverterOpenGL.h"

#include <QtGui/QOffscreenSurface>
#include <QtGui/QOpenGLContext>
#include <QtGui/QOpenGLFramebufferObject>

#include <boost/thread/thread.hpp>

#include <array>
#include <memory>
#include <string>
#include <vector>

namespace CoreVideoUtilsOpenGL
{

// One conversion, with the settings as they stood when it began. The buffers are as long as their images need.
struct VPixelFormatConverterOpenGL::VFrame
{
  KVZ::VideoFrameInfo m_Source{};
  const uint8_t* m_pSource = nullptr;
  size_t m_SourceSize = 0;
  KVZ::IPixelFormat::Enum m_Target = KVZ::IPixelFormat::EUnspecified;
  uint8_t* m_pTarget = nullptr;
  size_t m_TargetSize = 0;
  KVZ::VColourRecord m_Colour{};
  VLens m_Lens{};
  bool m_bLensEnabled = false;
};

enum class VPixelFormatConverterOpenGL::EResult
{
  Done,
  Refused,
  Lost,   // and so is this context for good
  NoOpenGL
};

class VPixelFormatConverterOpenGL::VImpl
{
public:
  explicit VImpl( const VSettings& i_rSettings );
  ~VImpl();

  // Why there is no context; empty where there is one.
  const std::string& WhyUnusable() const { return m_WhyUnusable; }
  // Refuses formats that are not supported, images larger than textures can be, and where OpenGL fails.
  EResult Convert( const VFrame& i_rFrame );

private:
  struct VOutput
  {
    KVZ::IPixelFormat::Enum m_Format;
    GLenum m_ReadFormat;
  };
  static const std::array<VOutput, 5> Outputs;

  std::string MakeContext();
  bool SetUpOutput( const VFrame& i_rFrame );
  CoreGraphics::VShaderProgram& Program( EProgram i_Program );
  void DrawFrame( const VFrame& i_rFrame, const VSourceFormat& i_rSource );
  void SetUniforms( CoreGraphics::VShaderProgram& i_rProgram, const VFrame& i_rFrame, const VUpload& i_rUpload ) const;
  void DrawMesh( const VLens& i_rLens );
  void ReadBack( uint8_t* o_pTarget );
  void ReadBackAsBytes( uint8_t* o_pTarget );
  void Report( EStep i_Step );

  const VSettings& m_rSettings;
  const boost::thread::id m_Thread = boost::this_thread::get_id();
  const VGraphicsCheck m_Check;
  QOffscreenSurface m_Surface;
  QOpenGLContext m_Context;
  std::string m_WhyUnusable;
  QOpenGLFunctions* m_pFunctions = nullptr;
  void ( *m_pPixelTransfer )( GLenum, GLfloat ) = nullptr;   // OpenGL ES has none
  GLint m_LargestImage = 0;
  VTextureKinds m_TextureKinds;

  // Gone before the context
  std::unique_ptr<QOpenGLFramebufferObject> m_pFramebuffer;
  std::unique_ptr<VideoGraphics::VVideoTexture> m_pTexture;
  std::unique_ptr<CoreGraphics::VMesh> m_pMesh;
  std::array<std::unique_ptr<CoreGraphics::VShaderProgram>, ProgramCount> m_Programs;   // made when they are first needed

  std::vector<uint8_t> m_Scratch;
  KVZ::VideoFrameInfo m_Input;
  const VOutput* m_pOutput = nullptr;
};

}
