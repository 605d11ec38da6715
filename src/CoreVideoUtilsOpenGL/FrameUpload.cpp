#include "CoreVideoUtilsOpenGL/FrameUpload.h"

#include "CoreVideoUtils/PackedBits.h"
#include "CoreVideoUtils/PixelRows.h"

#include <algorithm>
#include <cstring>

#ifndef GL_RGBA16
#define GL_RGBA16 0x805B
#endif
#ifndef GL_LUMINANCE8
#define GL_LUMINANCE8 0x8040
#endif
#ifndef GL_RGB8
#define GL_RGB8 0x8051
#endif

namespace CoreVideoUtilsOpenGL
{

namespace
{

using KVZ::IPixelFormat;

constexpr std::array Formats = {
  VSourceFormat{ IPixelFormat::ER5G6B5, EProgram::Raw },
  VSourceFormat{ IPixelFormat::ER8G8B8, EProgram::Raw },
  VSourceFormat{ IPixelFormat::EB8G8R8, EProgram::Raw, true },
  VSourceFormat{ IPixelFormat::ER8G8B8u8, EProgram::Raw },
  VSourceFormat{ IPixelFormat::EB8G8R8u8, EProgram::Raw, true },

  VSourceFormat{ IPixelFormat::EBayerRG8, EProgram::Bayer },
  VSourceFormat{ IPixelFormat::EBayerGB8, EProgram::Bayer, false, { 0.0f, 1.0f } },
  VSourceFormat{ IPixelFormat::EBayerGB7, EProgram::Bayer, false, { 0.0f, 1.0f } },
  VSourceFormat{ IPixelFormat::EBayerGB6, EProgram::Bayer, false, { 0.0f, 1.0f } },
  VSourceFormat{ IPixelFormat::EBayerGR8, EProgram::Bayer, false, { 1.0f, 0.0f } },
  VSourceFormat{ IPixelFormat::EBayerBG8, EProgram::Bayer, false, { 1.0f, 1.0f } },

  VSourceFormat{ IPixelFormat::ELuminance8, EProgram::Luminance },
  VSourceFormat{ IPixelFormat::ELuminance7, EProgram::Luminance },
  VSourceFormat{ IPixelFormat::ELuminance6, EProgram::Luminance },

  VSourceFormat{ IPixelFormat::EU8Y8V8Y8, EProgram::YUV, true },
  VSourceFormat{ IPixelFormat::EY8U8Y8V8, EProgram::YUV },
  VSourceFormat{ IPixelFormat::EU10Y10V10Y10, EProgram::YUV },
};
static_assert( Formats.size() == KVZ::PixelFormatCount - 1 );

// Formats of texels. The internal format of OpenGL ES 2.0 is the format itself.
struct VTexels
{
  GLint m_InternalFormat;
  GLenum m_Format;
  GLenum m_Type;
};
constexpr VTexels OneByte = { GL_LUMINANCE8, GL_LUMINANCE, GL_UNSIGNED_BYTE };
constexpr VTexels ThreeBytes = { GL_RGB8, GL_RGB, GL_UNSIGNED_BYTE };
constexpr VTexels FourBytes = { GL_RGBA8, GL_RGBA, GL_UNSIGNED_BYTE };
constexpr VTexels FourWords = { GL_RGBA16, GL_RGBA, GL_UNSIGNED_SHORT };

// One conversion of a frame to what is uploaded.
struct VPreparation
{
  const KVZ::VideoFrameInfo& m_rInfo;
  const uint8_t* m_pSource;
  std::vector<uint8_t>& m_rScratch;

  size_t Width() const { return m_rInfo.m_ImageWidth; }
  size_t Height() const { return m_rInfo.m_ImageHeight; }
  size_t Pairs() const { return ( Width() + 1 ) / 2; }
  uint8_t* Scratch( size_t i_Bytes ) const
  {
    m_rScratch.resize( std::max( m_rScratch.size(), i_Bytes ) );
    return m_rScratch.data();
  }
};

const uint8_t* SpreadBits( const VPreparation& i_rFrame, size_t i_Bits )
{
  const size_t Pixels = i_rFrame.Width() * i_rFrame.Height();
  uint8_t* const pTarget = i_rFrame.Scratch( Pixels );
  CoreVideoUtils::UnpackBits( i_Bits, i_rFrame.m_pSource, pTarget, Pixels );
  return pTarget;
}

const uint8_t* SpreadColour( const VPreparation& i_rFrame )
{
  const size_t Pixels = i_rFrame.Width() * i_rFrame.Height();
  uint8_t* const pTarget = i_rFrame.Scratch( 3 * Pixels );
  CoreVideoUtils::ConvertRow( { IPixelFormat::ER5G6B5, IPixelFormat::ER8G8B8 }, i_rFrame.m_pSource, pTarget, Pixels );
  return pTarget;
}

// Rows of an odd width end with half a texel: its second luma is never seen, its V is that of the pair before it.
const uint8_t* CompletePairs( const VPreparation& i_rFrame )
{
  if( i_rFrame.Width() % 2 == 0 )
  {
    return i_rFrame.m_pSource;
  }
  const size_t V = i_rFrame.m_rInfo.m_PixelFormat == IPixelFormat::EU8Y8V8Y8 ? 2 : 3;
  const size_t SourceBytes = 2 * i_rFrame.Width();
  const size_t TargetBytes = 4 * i_rFrame.Pairs();
  uint8_t* const pImage = i_rFrame.Scratch( TargetBytes * i_rFrame.Height() );
  for( size_t Row = 0; Row < i_rFrame.Height(); ++Row )
  {
    uint8_t* const pTarget = pImage + Row * TargetBytes;
    std::memcpy( pTarget, i_rFrame.m_pSource + Row * SourceBytes, SourceBytes );
    uint8_t* const pLast = pTarget + TargetBytes - 4;
    pLast[5 - V] = 0;
    pLast[V] = i_rFrame.Pairs() > 1 ? pLast[V - 4] : 128;
  }
  return pImage;
}

// What each code of ten bits becomes in a texel: colour differences, and luma.
template<class TComponent>
class VTenBitTable
{
public:
  VTenBitTable()
  {
    const double Full = static_cast<TComponent>( ~TComponent{ 0 } );
    const auto Limit = [Full]( double i_Value ) { return static_cast<TComponent>( std::clamp( i_Value + 0.5, 0.0, Full ) ); };
    for( int32_t Code = 0; Code < 1024; ++Code )
    {
      m_Values[0][static_cast<size_t>( Code )] = Limit( Full * ( ( Code - 512 ) / 1020.0 + 0.5 ) );
      m_Values[1][static_cast<size_t>( Code )] = Limit( Full * Code / 1020.0 );
    }
  }

  std::array<std::array<TComponent, 1024>, 2> m_Values;
};

// Four words hold six pixels, from the low end as U Y V Y and again: three texels of y0 u y1 v, of which the first are written.
template<class TComponent>
void SpreadGroup( const VTenBitTable<TComponent>& i_rTable, const uint8_t* i_pWords, TComponent* o_pTexels, size_t i_Texels )
{
  std::array<TComponent, 12> Texels;
  for( size_t Word = 0; Word < 4; ++Word )
  {
    uint32_t Codes = 0;
    std::memcpy( &Codes, i_pWords + 4 * Word, sizeof( Codes ) );
    for( size_t Index = 3 * Word; Index < 3 * Word + 3; ++Index, Codes >>= 10 )
    {
      Texels[Index ^ 1] = i_rTable.m_Values[Index % 2][Codes & 0x3FF];
    }
  }
  std::copy_n( Texels.begin(), 4 * i_Texels, o_pTexels );
}

template<class TComponent>
const uint8_t* SpreadTenBits( const VPreparation& i_rFrame )
{
  static const VTenBitTable<TComponent> s_Table;
  const size_t SourceBytes = ( i_rFrame.Width() + 47 ) / 48 * 128;
  uint8_t* const pImage = i_rFrame.Scratch( 4 * sizeof( TComponent ) * i_rFrame.Pairs() * i_rFrame.Height() );
  for( size_t Row = 0; Row < i_rFrame.Height(); ++Row )
  {
    const uint8_t* const pSource = i_rFrame.m_pSource + Row * SourceBytes;
    TComponent* const pTarget = reinterpret_cast<TComponent*>( pImage ) + 4 * Row * i_rFrame.Pairs();
    for( size_t Texel = 0; Texel < i_rFrame.Pairs(); Texel += 3 )
    {
      SpreadGroup( s_Table, pSource + Texel / 3 * 16, pTarget + 4 * Texel, std::min<size_t>( 3, i_rFrame.Pairs() - Texel ) );
    }
  }
  return pImage;
}

VTexels TexelsOf( IPixelFormat::Enum i_Format, EProgram i_Program, bool i_bOpenGLES )
{
  if( i_Program == EProgram::Bayer || i_Program == EProgram::Luminance )
  {
    return OneByte;
  }
  if( i_Program == EProgram::YUV )
  {
    return i_Format == IPixelFormat::EU10Y10V10Y10 && !i_bOpenGLES ? FourWords : FourBytes;
  }
  return i_Format == IPixelFormat::ER8G8B8u8 || i_Format == IPixelFormat::EB8G8R8u8 ? FourBytes : ThreeBytes;
}

const uint8_t* PixelsOf( const VPreparation& i_rFrame, bool i_bOpenGLES )
{
  switch( i_rFrame.m_rInfo.m_PixelFormat )
  {
    case IPixelFormat::ER5G6B5: return SpreadColour( i_rFrame );
    case IPixelFormat::EBayerGB7:
    case IPixelFormat::ELuminance7: return SpreadBits( i_rFrame, 7 );
    case IPixelFormat::EBayerGB6:
    case IPixelFormat::ELuminance6: return SpreadBits( i_rFrame, 6 );
    case IPixelFormat::EU8Y8V8Y8:
    case IPixelFormat::EY8U8Y8V8: return CompletePairs( i_rFrame );
    case IPixelFormat::EU10Y10V10Y10: return i_bOpenGLES ? SpreadTenBits<uint8_t>( i_rFrame ) : SpreadTenBits<uint16_t>( i_rFrame );
    default: return i_rFrame.m_pSource;
  }
}

}

const VSourceFormat* FindSourceFormat( IPixelFormat::Enum i_Format )
{
  const auto* const pFound = std::find_if( Formats.begin(), Formats.end(),
    [&]( const VSourceFormat& i_rRow ) { return i_rRow.m_Format == i_Format; } );
  return pFound != Formats.end() ? pFound : nullptr;
}

VUpload PrepareUpload( const KVZ::VideoFrameInfo& i_rInfo, const uint8_t* i_pSource, bool i_bOpenGLES, std::vector<uint8_t>& io_rScratch )
{
  const VPreparation Frame = { i_rInfo, i_pSource, io_rScratch };
  const EProgram Program = FindSourceFormat( i_rInfo.m_PixelFormat )->m_Program;
  const VTexels Texels = TexelsOf( i_rInfo.m_PixelFormat, Program, i_bOpenGLES );
  const size_t Columns = Program == EProgram::YUV ? Frame.Pairs() : Frame.Width();
  const size_t Pixels = Program == EProgram::YUV ? 2 * Columns : Columns;
  VUpload Upload;
  Upload.m_Layout = { static_cast<GLsizei>( Columns ), static_cast<GLsizei>( Frame.Height() ),
    i_bOpenGLES ? static_cast<GLint>( Texels.m_Format ) : Texels.m_InternalFormat, Texels.m_Format, Texels.m_Type };
  Upload.m_pPixels = PixelsOf( Frame, i_bOpenGLES );
  Upload.m_Resolution = { static_cast<float>( Pixels ), static_cast<float>( Frame.Height() ) };
  Upload.m_Scale = { static_cast<float>( Frame.Width() ) / static_cast<float>( Pixels ), 1.0f };
  return Upload;
}

}
