#include "CoreGraphics/VideoTexture.h"

#include <QtGui/QOpenGLContext>

namespace VideoGraphics
{

// Outside the image lies its nearest pixel.
VVideoTexture::VVideoTexture() : m_rFunctions( *QOpenGLContext::currentContext()->functions() )
{
  m_rFunctions.glGenTextures( 1, &m_Id );
  m_rFunctions.glBindTexture( GL_TEXTURE_2D, m_Id );
  m_rFunctions.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, GL_CLAMP_TO_EDGE );
  m_rFunctions.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, GL_CLAMP_TO_EDGE );
}

VVideoTexture::~VVideoTexture() { m_rFunctions.glDeleteTextures( 1, &m_Id ); }

void VVideoTexture::Update( const VTextureLayout& i_rLayout, const uint8_t* i_pPixels )
{
  m_rFunctions.glActiveTexture( GL_TEXTURE0 );
  m_rFunctions.glBindTexture( GL_TEXTURE_2D, m_Id );
  m_rFunctions.glPixelStorei( GL_UNPACK_ALIGNMENT, 1 );
  if( i_rLayout == m_Layout )
  {
    m_rFunctions.glTexSubImage2D( GL_TEXTURE_2D, 0, 0, 0, i_rLayout.m_Width, i_rLayout.m_Height, i_rLayout.m_Format, i_rLayout.m_Type, i_pPixels );
    return;
  }
  m_rFunctions.glTexImage2D( GL_TEXTURE_2D, 0, i_rLayout.m_InternalFormat, i_rLayout.m_Width, i_rLayout.m_Height, 0, i_rLayout.m_Format,
    i_rLayout.m_Type, i_pPixels );
  m_Layout = i_rLayout;
}

void VVideoTexture::SetSmooth( bool i_bSmooth )
{
  const GLint Filter = i_bSmooth ? GL_LINEAR : GL_NEAREST;
  m_rFunctions.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, Filter );
  m_rFunctions.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, Filter );
}

}
