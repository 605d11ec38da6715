// A texture that one video frame after the other goes to. Belongs to the OpenGL context that is current when it is made.
#pragma once

#include <QtGui/QOpenGLFunctions>

#include <cstdint>

namespace VideoGraphics
{

// How the bytes of an image lie, in the words of glTexImage2D. Rows follow each other without padding.
struct VTextureLayout
{
  GLsizei m_Width = 0;   // texels
  GLsizei m_Height = 0;
  GLint m_InternalFormat = 0;
  GLenum m_Format = 0;
  GLenum m_Type = 0;

  bool operator==( const VTextureLayout& ) const = default;
};

class VVideoTexture
{
public:
  VVideoTexture();
  ~VVideoTexture();
  VVideoTexture( const VVideoTexture& ) = delete;
  VVideoTexture& operator=( const VVideoTexture& ) = delete;

  // An image of the same layout as the one before is written into the same memory. Binds the texture.
  void Update( const VTextureLayout& i_rLayout, const uint8_t* i_pPixels );
  // Between texels: their weighted mean, or the nearest. After Update.
  void SetSmooth( bool i_bSmooth );

private:
  QOpenGLFunctions& m_rFunctions;
  GLuint m_Id = 0;
  VTextureLayout m_Layout;
};

}
