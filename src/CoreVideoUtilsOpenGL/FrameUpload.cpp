#include "CoreVideoUtilsOpenGL/FrameUpload.h"

#include "CoreVideoUtils/PackedBits.h"
#include "CoreVideoUtils/PixelRows.h"

#include <algorithm>
#include <cstddef>
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

// Formats of texels. The internal format of OpenGL ES is the format itself, but for 16 bits.
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

// What a code of eight bits becomes in a texel, with 128 of a colour difference at one half where there are 16. Of its 0, which is no picture's,
// half a code is cut off there.
template<class TComponent>
TComponent LumaOf( uint8_t i_Code )
{
  return static_cast<TComponent>( sizeof( TComponent ) == 1 ? i_Code : 257 * i_Code );
}

template<class TComponent>
TComponent ChromaOf( uint8_t i_Code )
{
  return static_cast<TComponent>( sizeof( TComponent ) == 1 ? i_Code : std::max( 257 * i_Code, 128 ) - 128 );
}

// Rows of an odd width end with half a texel: its second luma is never seen, its V is that of the pair before it.
template<class TComponent>
const uint8_t* SpreadPairs( const VPreparation& i_rFrame )
{
  if( sizeof( TComponent ) == 1 && i_rFrame.Width() % 2 == 0 )
  {
    return i_rFrame.m_pSource;
  }
  const size_t Luma = i_rFrame.m_rInfo.m_PixelFormat == IPixelFormat::EU8Y8V8Y8 ? 1 : 0;
  const size_t Chroma = 1 - Luma;
  uint8_t* const pImage = i_rFrame.Scratch( 4 * sizeof( TComponent ) * i_rFrame.Pairs() * i_rFrame.Height() );
  for( size_t Row = 0; Row < i_rFrame.Height(); ++Row )
  {
    const uint8_t* const pSource = i_rFrame.m_pSource + Row * 2 * i_rFrame.Width();
    TComponent* const pTarget = reinterpret_cast<TComponent*>( pImage ) + 4 * Row * i_rFrame.Pairs();
    for( size_t Pixel = 0; Pixel < i_rFrame.Width(); ++Pixel )
    {
      pTarget[2 * Pixel + Luma] = LumaOf<TComponent>( pSource[2 * Pixel + Luma] );
      pTarget[2 * Pixel + Chroma] = ChromaOf<TComponent>( pSource[2 * Pixel + Chroma] );
    }
    if( i_rFrame.Width() % 2 != 0 )
    {
      TComponent* const pLast = pTarget + 2 * i_rFrame.Width();
      pLast[Luma] = 0;
      pLast[Chroma] = i_rFrame.Width() > 1 ? pLast[static_cast<std::ptrdiff_t>( Chroma ) - 4] : ChromaOf<TComponent>( 128 );
    }
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

VTexels TexelsOf( IPixelFormat::Enum i_Format, EProgram i_Program, const VTextureKinds& i_rKinds )
{
  if( i_Program == EProgram::Bayer || i_Program == EProgram::Luminance )
  {
    return OneByte;
  }
  if( i_Program == EProgram::YUV )
  {
    return i_rKinds.m_b16Bits ? FourWords : FourBytes;
  }
  return i_Format == IPixelFormat::ER8G8B8u8 || i_Format == IPixelFormat::EB8G8R8u8 ? FourBytes : ThreeBytes;
}

const uint8_t* PixelsOf( const VPreparation& i_rFrame, bool i_b16Bits )
{
  switch( i_rFrame.m_rInfo.m_PixelFormat )
  {
    case IPixelFormat::ER5G6B5: return SpreadColour( i_rFrame );
    case IPixelFormat::EBayerGB7:
    case IPixelFormat::ELuminance7: return SpreadBits( i_rFrame, 7 );
    case IPixelFormat::EBayerGB6:
    case IPixelFormat::ELuminance6: return SpreadBits( i_rFrame, 6 );
    case IPixelFormat::EU8Y8V8Y8:
    case IPixelFormat::EY8U8Y8V8: return i_b16Bits ? SpreadPairs<uint16_t>( i_rFrame ) : SpreadPairs<uint8_t>( i_rFrame );
    case IPixelFormat::EU10Y10V10Y10: return i_b16Bits ? SpreadTenBits<uint16_t>( i_rFrame ) : SpreadTenBits<uint8_t>( i_rFrame );
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

VUpload PrepareUpload( const KVZ::VideoFrameInfo& i_rInfo, const uint8_t* i_pSource, const VTextureKinds& i_rKinds,
  std::vector<uint8_t>& io_rScratch )
{
  const VPreparation Frame = { i_rInfo, i_pSource, io_rScratch };
  const EProgram Program = FindSourceFormat( i_rInfo.m_PixelFormat )->m_Program;
  const VTexels Texels = TexelsOf( i_rInfo.m_PixelFormat, Program, i_rKinds );
  const size_t Columns = Program == EProgram::YUV ? Frame.Pairs() : Frame.Width();
  const size_t Pixels = Program == EProgram::YUV ? 2 * Columns : Columns;
  VUpload Upload;
  Upload.m_Layout = { static_cast<GLsizei>( Columns ), static_cast<GLsizei>( Frame.Height() ),
    i_rKinds.m_bSized || Texels.m_Type == GL_UNSIGNED_SHORT ? Texels.m_InternalFormat : static_cast<GLint>( Texels.m_Format ), Texels.m_Format,
    Texels.m_Type };
  Upload.m_pPixels = PixelsOf( Frame, i_rKinds.m_b16Bits );
  Upload.m_Resolution = { static_cast<float>( Pixels ), static_cast<float>( Frame.Height() ) };
  Upload.m_Scale = { static_cast<float>( Frame.Width() ) / static_cast<float>( Pixels ), 1.0f };
  return Upload;
}

}
