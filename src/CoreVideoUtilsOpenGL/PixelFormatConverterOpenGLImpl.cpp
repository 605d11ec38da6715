#include "CoreVideoUtilsOpenGL/PixelFormatConverterOpenGLImpl.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>

#ifndef GL_BGR
#define GL_BGR 0x80E0
#endif
#ifndef GL_BGRA
#define GL_BGRA 0x80E1
#endif
#ifndef GL_CONTEXT_LOST
#define GL_CONTEXT_LOST 0x0507
#endif

namespace CoreVideoUtilsOpenGL
{

namespace
{

using KVZ::IPixelFormat;

constexpr std::array<const char*, ProgramCount> FragmentFiles = { "VideoRaw.glsl", "VideoBayer.glsl", "VideoLuminance.glsl", "VideoYUV.glsl" };

// With nothing that a frame has no use for.
QSurfaceFormat MakeFormat( QSurfaceFormat::RenderableType i_Type )
{
  QSurfaceFormat Format = QSurfaceFormat::defaultFormat();
  Format.setRenderableType( i_Type );
  Format.setVersion( 2, i_Type == QSurfaceFormat::OpenGLES ? 0 : 1 );
  Format.setProfile( QSurfaceFormat::NoProfile );
  Format.setDepthBufferSize( 0 );
  Format.setStencilBufferSize( 0 );
  Format.setSamples( 0 );
  return Format;
}

// As the process's default has it, or else OpenGL ES: some of Qt's platforms have nothing else.
bool Create( QOpenGLContext& io_rContext )
{
  for( const QSurfaceFormat::RenderableType Type : { QSurfaceFormat::defaultFormat().renderableType(), QSurfaceFormat::OpenGLES } )
  {
    io_rContext.setFormat( MakeFormat( Type ) );
    if( io_rContext.create() )
    {
      return true;
    }
  }
  return false;
}

std::array<float, 2> ToFloats( const std::array<double, 2>& i_rValues )
{
  return { static_cast<float>( i_rValues[0] ), static_cast<float>( i_rValues[1] ) };
}

// From red, green, blue and alpha to what OpenGL ES cannot give by itself.
void Reorder( const uint8_t* i_pPixels, size_t i_Count, IPixelFormat::Enum i_Target, uint8_t* o_pTarget )
{
  const bool bBlueFirst = i_Target == IPixelFormat::EB8G8R8 || i_Target == IPixelFormat::EB8G8R8u8;
  const bool bFour = i_Target == IPixelFormat::ER8G8B8u8 || i_Target == IPixelFormat::EB8G8R8u8;
  for( const uint8_t* pPixel = i_pPixels; pPixel != i_pPixels + 4 * i_Count; pPixel += 4 )
  {
    if( i_Target == IPixelFormat::ELuminance8 )
    {
      *o_pTarget++ = static_cast<uint8_t>( ( pPixel[0] + pPixel[1] + pPixel[2] + 1 ) / 3 );
      continue;
    }
    *o_pTarget++ = pPixel[bBlueFirst ? 2 : 0];
    *o_pTarget++ = pPixel[1];
    *o_pTarget++ = pPixel[bBlueFirst ? 0 : 2];
    if( bFour )
    {
      *o_pTarget++ = pPixel[3];
    }
  }
}

}

constexpr std::array<VPixelFormatConverterOpenGL::VImpl::VOutput, 5> VPixelFormatConverterOpenGL::VImpl::Outputs = {
  VOutput{ IPixelFormat::ELuminance8, GL_LUMINANCE },
  VOutput{ IPixelFormat::ER8G8B8, GL_RGB },
  VOutput{ IPixelFormat::EB8G8R8, GL_BGR },
  VOutput{ IPixelFormat::ER8G8B8u8, GL_RGBA },
  VOutput{ IPixelFormat::EB8G8R8u8, GL_BGRA },
};

VPixelFormatConverterOpenGL::VImpl::VImpl( const VSettings& i_rSettings ) : m_rSettings( i_rSettings ) { m_WhyUnusable = MakeContext(); }

VPixelFormatConverterOpenGL::VImpl::~VImpl()
{
  KVZ_ASSERT( boost::this_thread::get_id() == m_Thread );
  if( !m_WhyUnusable.empty() || !m_Context.makeCurrent( &m_Surface ) )
  {
    return;
  }
  m_pFramebuffer.reset();
  m_pTexture.reset();
  m_pMesh.reset();
  m_Programs = {};
  m_Context.doneCurrent();
}

std::string VPixelFormatConverterOpenGL::VImpl::MakeContext()
{
  if( !m_Check.WhyUnusable().empty() )
  {
    return m_Check.WhyUnusable();
  }
  if( !Create( m_Context ) )
  {
    return "no OpenGL context can be made";
  }
  m_Surface.setFormat( m_Context.format() );
  m_Surface.create();
  if( !m_Context.makeCurrent( &m_Surface ) )
  {
    return "the OpenGL context has no surface to draw on";
  }
  m_Check.OutliveDisplay();
  if( !QOpenGLFramebufferObject::hasOpenGLFramebufferObjects() )
  {
    return "this OpenGL has no framebuffer objects";
  }
  m_pFunctions = m_Context.functions();
  m_pPixelTransfer = reinterpret_cast<void ( * )( GLenum, GLfloat )>( m_Context.getProcAddress( "glPixelTransferf" ) );
  m_TextureKinds = { !m_Context.isOpenGLES(), !m_Context.isOpenGLES() || m_Context.hasExtension( "GL_EXT_texture_norm16" ) };
  m_pFunctions->glGetIntegerv( GL_MAX_TEXTURE_SIZE, &m_LargestImage );
  m_pFunctions->glDisable( GL_DITHER );
  KVZ_LOG_INFORMATION( "CoreVideoUtilsOpenGL", "OpenGL %1% of \"%2%\"", reinterpret_cast<const char*>( m_pFunctions->glGetString( GL_VERSION ) ),
    reinterpret_cast<const char*>( m_pFunctions->glGetString( GL_RENDERER ) ) );
  return {};
}

VPixelFormatConverterOpenGL::EResult VPixelFormatConverterOpenGL::VImpl::Convert( const VFrame& i_rFrame )
{
  KVZ_ASSERT( boost::this_thread::get_id() == m_Thread );
  const VSourceFormat* const pSource = FindSourceFormat( i_rFrame.m_Source.m_PixelFormat );
  if( !pSource )
  {
    return EResult::Refused;
  }
  if( !m_Context.makeCurrent( &m_Surface ) || m_Check.HasDisplayEnded() )
  {
    return EResult::Lost;
  }
  if( !SetUpOutput( i_rFrame ) || !Program( pSource->m_Program ).IsValid() )
  {
    return EResult::Refused;
  }
  DrawFrame( i_rFrame, *pSource );
  ReadBack( i_rFrame.m_pTarget );
  Report( EStep::ReadBack );
  const GLenum Error = m_pFunctions->glGetError();
  if( Error == GL_NO_ERROR )
  {
    return EResult::Done;
  }
  KVZ_LOG_ERROR( "CoreVideoUtilsOpenGL", "OpenGL error %1% while a frame was converted", Error );
  return Error == GL_CONTEXT_LOST ? EResult::Lost : EResult::Refused;
}

void VPixelFormatConverterOpenGL::VImpl::DrawFrame( const VFrame& i_rFrame, const VSourceFormat& i_rSource )
{
  const VUpload Upload = PrepareUpload( m_Input, i_rFrame.m_pSource, m_TextureKinds, m_Scratch );
  Report( EStep::Prepared );
  m_pTexture->Update( Upload.m_Layout, Upload.m_pPixels );
  // Shaders that take a texel's components apart look at the middle of one.
  m_pTexture->SetSmooth( !i_rFrame.m_Lens.IsOff() && ( i_rSource.m_Program == EProgram::Raw || i_rSource.m_Program == EProgram::Luminance ) );
  Report( EStep::Uploaded );
  CoreGraphics::VShaderProgram& rProgram = Program( i_rSource.m_Program );
  rProgram.Use();
  SetUniforms( rProgram, i_rFrame, Upload );
  DrawMesh( i_rFrame.m_Lens );
  Report( EStep::Drawn );
}

bool VPixelFormatConverterOpenGL::VImpl::SetUpOutput( const VFrame& i_rFrame )
{
  m_Input = i_rFrame.m_Source;
  const auto* const pFound = std::find_if( Outputs.begin(), Outputs.end(),
    [&]( const VOutput& i_rRow ) { return i_rRow.m_Format == i_rFrame.m_Target; } );
  const auto Largest = static_cast<uint32_t>( m_LargestImage );
  if( pFound == Outputs.end() || m_Input.m_ImageWidth > Largest || m_Input.m_ImageHeight > Largest )
  {
    return false;
  }
  m_pOutput = pFound;
  const QSize Size( static_cast<int>( m_Input.m_ImageWidth ), static_cast<int>( m_Input.m_ImageHeight ) );
  if( !m_pFramebuffer || m_pFramebuffer->size() != Size )
  {
    m_pFramebuffer.reset();
    m_pFramebuffer = std::make_unique<QOpenGLFramebufferObject>( Size, QOpenGLFramebufferObject::NoAttachment, GL_TEXTURE_2D,
      m_Context.isOpenGLES() ? GL_RGBA : GL_RGBA8 );
  }
  if( !m_pTexture )
  {
    m_pTexture = std::make_unique<VideoGraphics::VVideoTexture>();
  }
  return m_pFramebuffer->isValid() && m_pFramebuffer->bind();
}

// One that could not be made is not tried again.
CoreGraphics::VShaderProgram& VPixelFormatConverterOpenGL::VImpl::Program( EProgram i_Program )
{
  const auto Index = static_cast<size_t>( i_Program );
  if( !m_Programs[Index] )
  {
    m_Programs[Index] = std::make_unique<CoreGraphics::VShaderProgram>( m_rSettings.m_ShaderRoot + "/VertexShaders/Video.glsl",
      m_rSettings.m_ShaderRoot + "/FragmentShaders/" + FragmentFiles[Index] );
  }
  return *m_Programs[Index];
}

// The sensor is the image, which is neither rotated nor moved. Its first row goes to the framebuffer's lowest, because that is read first: so
// the view is scaled by -1 upwards.
void VPixelFormatConverterOpenGL::VImpl::SetUniforms( CoreGraphics::VShaderProgram& i_rProgram, const VFrame& i_rFrame,
  const VUpload& i_rUpload ) const
{
  const VSourceFormat& rSource = *FindSourceFormat( m_Input.m_PixelFormat );
  const std::array<float, 2> Size = { static_cast<float>( m_Input.m_ImageWidth ), static_cast<float>( m_Input.m_ImageHeight ) };
  const auto& rK = i_rFrame.m_Lens.m_Parameters;
  i_rProgram.Set( "t_DiffuseTexture", 0 );
  i_rProgram.Set( "u_FirstRed", rSource.m_FirstRed );
  i_rProgram.Set( "u_Resolution", i_rUpload.m_Resolution );
  i_rProgram.Set( "u_Swizzle", rSource.m_bSwizzle );
  i_rProgram.Set( "u_Inverted", m_Input.m_bInverted );
  i_rProgram.Set( "u_VideoScaleAndOffset", std::array<float, 4>{ i_rUpload.m_Scale[0], i_rUpload.m_Scale[1], 0.0f, 0.0f } );
  i_rProgram.Set( "u_ColourCorrection", std::array<float, 2>{ i_rFrame.m_Colour.m_GammaCorrection, i_rFrame.m_Colour.m_Saturation } );
  i_rProgram.Set( "u_View2D", std::array<float, 4>{ 1.0f, -1.0f, 0.5f, 0.5f } );
  i_rProgram.Set( "u_RadialDistortionCentre", ToFloats( i_rFrame.m_Lens.m_Centre ) );
  i_rProgram.Set( "u_RadialDistortionParameters",
    std::array<float, 3>{ static_cast<float>( rK[0] ), static_cast<float>( rK[1] ), static_cast<float>( rK[2] ) } );
  i_rProgram.SetMatrix2( "u_Rotation", { 1.0f, 0.0f, 0.0f, 1.0f } );
  i_rProgram.Set( "u_RotationCentre", std::array<float, 2>{ 0.5f * Size[0], 0.5f * Size[1] } );
  i_rProgram.Set( "u_SensorSize", Size );
}

void VPixelFormatConverterOpenGL::VImpl::DrawMesh( const VLens& i_rLens )
{
  const VMeshCells Cells = CellsFor( i_rLens, m_Input.m_ImageWidth, m_Input.m_ImageHeight );
  if( !m_pMesh || !m_pMesh->Has( Cells.m_Columns, Cells.m_Rows ) )
  {
    m_pMesh = std::make_unique<CoreGraphics::VMesh>( Cells.m_Columns, Cells.m_Rows );
  }
  m_pFunctions->glViewport( 0, 0, static_cast<GLsizei>( m_Input.m_ImageWidth ), static_cast<GLsizei>( m_Input.m_ImageHeight ) );
  m_pFunctions->glClearColor( 0.0f, 0.0f, 0.0f, 0.5f );
  m_pFunctions->glClear( GL_COLOR_BUFFER_BIT );
  m_pMesh->Draw( CoreGraphics::VShaderProgram::PositionAttribute );
}

// Straight into the caller's memory, and waits for the drawing. Two pixel buffers in turn would let the card copy one frame while it draws the
// next; but who calls Convert has its own frame when it returns, so there is never a next one to draw meanwhile, and a buffer would be one copy
// more. What overlaps is what callers do with frames that they have.
void VPixelFormatConverterOpenGL::VImpl::ReadBack( uint8_t* o_pTarget )
{
  m_pFunctions->glPixelStorei( GL_PACK_ALIGNMENT, 1 );
  const bool bLuminance = m_pOutput->m_ReadFormat == GL_LUMINANCE;
  if( m_Context.isOpenGLES() || ( bLuminance && !m_pPixelTransfer ) )
  {
    ReadBackAsBytes( o_pTarget );
    return;
  }
  // Luminance is the sum of the three.
  const auto SetScale = [&]( GLfloat i_Scale )
  {
    for( const GLenum Component : { GL_RED_SCALE, GL_GREEN_SCALE, GL_BLUE_SCALE } )
    {
      m_pPixelTransfer( Component, i_Scale );
    }
  };
  if( bLuminance )
  {
    SetScale( 1.0f / 3.0f );
  }
  m_pFunctions->glReadPixels( 0, 0, static_cast<GLsizei>( m_Input.m_ImageWidth ), static_cast<GLsizei>( m_Input.m_ImageHeight ),
    m_pOutput->m_ReadFormat, GL_UNSIGNED_BYTE, o_pTarget );
  if( bLuminance )
  {
    SetScale( 1.0f );
  }
}

// OpenGL ES 2.0 reads nothing but red, green, blue and alpha.
void VPixelFormatConverterOpenGL::VImpl::ReadBackAsBytes( uint8_t* o_pTarget )
{
  const size_t Pixels = size_t{ m_Input.m_ImageWidth } * m_Input.m_ImageHeight;
  m_Scratch.resize( std::max( m_Scratch.size(), 4 * Pixels ) );
  m_pFunctions->glReadPixels( 0, 0, static_cast<GLsizei>( m_Input.m_ImageWidth ), static_cast<GLsizei>( m_Input.m_ImageHeight ), GL_RGBA,
    GL_UNSIGNED_BYTE, m_Scratch.data() );
  Reorder( m_Scratch.data(), Pixels, m_pOutput->m_Format, o_pTarget );
}

void VPixelFormatConverterOpenGL::VImpl::Report( EStep i_Step )
{
  if( m_rSettings.m_OnStep )
  {
    m_pFunctions->glFinish();
    m_rSettings.m_OnStep( i_Step );
  }
}

}
