#include "CoreVideoUtils/BurnInText.h"

#include "Core/VideoInterface/EnumTable.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <array>
#include <cstring>
#include <vector>

namespace CoreVideoUtils
{

namespace
{

using KVZ::IPixelFormat;

constexpr size_t GreyCount = 256;

// What an image of one grey value turns into.
class VGreyPatch
{
public:
  VGreyPatch( KVZ::IPixelFormatConverter& i_rConverter, uint32_t i_Pixels ) : m_rConverter( i_rConverter ), m_Pixels( i_Pixels ) {}

  // Converts through each of the formats in turn.
  bool Make( uint8_t i_Grey, const std::vector<IPixelFormat::Enum>& i_rFormats )
  {
    KVZ::VideoFrameInfo Info;
    Info.m_ImageWidth = m_Pixels;
    Info.m_ImageHeight = 1;
    Info.m_PixelFormat = IPixelFormat::ELuminance8;
    m_Bytes.assign( m_Pixels, i_Grey );
    for( const IPixelFormat::Enum Format : i_rFormats )
    {
      m_Next.assign( KVZ::GetImageSize( Format, m_Pixels, 1 ), 0 );
      if( !m_rConverter.Convert( Info, m_Bytes.data(), m_Bytes.size(), Format, m_Next.data(), m_Next.size() ) )
      {
        return false;
      }
      m_Bytes.swap( m_Next );
      Info.m_PixelFormat = Format;
    }
    return true;
  }

  // The first of these lists that the converter can follow to its end; empty where there is none.
  std::vector<IPixelFormat::Enum> ChooseFormats( IPixelFormat::Enum i_Target )
  {
    for( const std::vector<IPixelFormat::Enum>& rFormats : { std::vector<IPixelFormat::Enum>{ i_Target }, { IPixelFormat::ER8G8B8, i_Target },
           { IPixelFormat::ER8G8B8, IPixelFormat::EU8Y8V8Y8, i_Target } } )
    {
      if( Make( 0, rFormats ) )
      {
        return rFormats;
      }
    }
    return {};
  }

  const std::vector<uint8_t>& Bytes() const { return m_Bytes; }

private:
  KVZ::IPixelFormatConverter& m_rConverter;
  const uint32_t m_Pixels;
  std::vector<uint8_t> m_Bytes;
  std::vector<uint8_t> m_Next;
};

// Calls the function for each grey value with what it is in the target format. False if one cannot be converted.
template<class TFunction>
bool ForEachGrey( KVZ::IPixelFormatConverter& i_rConverter, IPixelFormat::Enum i_Target, uint32_t i_Pixels, const TFunction& i_rFunction )
{
  VGreyPatch Patch( i_rConverter, i_Pixels );
  const std::vector<IPixelFormat::Enum> Formats = Patch.ChooseFormats( i_Target );
  for( size_t Grey = 0; Grey < GreyCount; ++Grey )
  {
    if( Formats.empty() || !Patch.Make( static_cast<uint8_t>( Grey ), Formats ) )
    {
      return false;
    }
    i_rFunction( Grey, Patch.Bytes() );
  }
  return true;
}

// Images whose pixels are whole bytes, one after another without a gap. In 4:2:2 each pixel brings its own half of the chroma, and that of
// grey is the same in both halves.
class VBytePixels
{
public:
  VBytePixels( uint8_t* io_pPixels, size_t i_Size ) : m_pPixels( io_pPixels ), m_Size( i_Size ) {}

  bool Prepare( KVZ::IPixelFormatConverter& i_rConverter, IPixelFormat::Enum i_Format )
  {
    m_PixelBytes = static_cast<size_t>( KVZ::GetImageSize( i_Format, 1, 1 ) );
    return m_PixelBytes <= MaxPixelBytes &&
      ForEachGrey( i_rConverter, i_Format, 1,
        [this]( size_t i_Grey, const std::vector<uint8_t>& i_rPixel ) { std::memcpy( m_Table[i_Grey].data(), i_rPixel.data(), m_PixelBytes ); } );
  }

  // A pixel by its number from the image's first.
  void Paint( uint64_t i_Pixel, uint8_t i_Grey ) const
  {
    const uint64_t Offset = i_Pixel * m_PixelBytes;
    if( Offset + m_PixelBytes <= m_Size )
    {
      std::memcpy( m_pPixels + Offset, m_Table[i_Grey].data(), m_PixelBytes );
    }
  }

private:
  static constexpr size_t MaxPixelBytes = 4;

  uint8_t* const m_pPixels;
  const size_t m_Size;
  size_t m_PixelBytes = 0;
  std::array<std::array<uint8_t, MaxPixelBytes>, GreyCount> m_Table{};
};

// The 10-bit format: six pixels in four words of three samples, U0 Y0 V0, Y1 U1 Y2, V1 Y3 U2, Y4 V2 Y5, each from the low end.
class VTenBitPixels
{
public:
  VTenBitPixels( uint8_t* io_pPixels, size_t i_Size, uint32_t i_Width )
    : m_pPixels( io_pPixels ), m_Size( i_Size ), m_Width( i_Width ), m_Stride( KVZ::GetImageSize( IPixelFormat::EU10Y10V10Y10, i_Width, 1 ) )
  {
  }

  bool Prepare( KVZ::IPixelFormatConverter& i_rConverter, IPixelFormat::Enum i_Format )
  {
    return ForEachGrey( i_rConverter, i_Format, GroupPixels,
      [this]( size_t i_Grey, const std::vector<uint8_t>& i_rGroup )
      {
        uint32_t Word = 0;
        std::memcpy( &Word, i_rGroup.data(), sizeof( Word ) );
        m_Table[i_Grey] = Word;
      } );
  }

  void Paint( uint64_t i_Pixel, uint8_t i_Grey ) const
  {
    const uint64_t Column = i_Pixel % m_Width;
    const uint64_t Group = i_Pixel / m_Width * m_Stride + Column / GroupPixels * GroupBytes;
    if( Group + GroupBytes > m_Size )
    {
      return;
    }
    const uint64_t InGroup = Column % GroupPixels;
    const uint64_t Chroma = InGroup / 2 * 4;   // the pair's U; its V is two samples on
    SetSample( Group, Chroma, m_Table[i_Grey] & SampleMask );
    SetSample( Group, InGroup * 2 + 1, m_Table[i_Grey] >> 10 & SampleMask );
    SetSample( Group, Chroma + 2, m_Table[i_Grey] >> 20 & SampleMask );
  }

private:
  static constexpr uint32_t GroupPixels = 6;
  static constexpr uint64_t GroupBytes = 16;
  static constexpr uint32_t SampleMask = 0x3FF;

  void SetSample( uint64_t i_Group, uint64_t i_Sample, uint32_t i_Value ) const
  {
    uint8_t* const pWord = m_pPixels + i_Group + i_Sample / 3 * sizeof( uint32_t );
    const auto Shift = static_cast<uint32_t>( i_Sample % 3 * 10 );
    uint32_t Word = 0;
    std::memcpy( &Word, pWord, sizeof( Word ) );
    Word = ( Word & ~( SampleMask << Shift ) ) | i_Value << Shift;
    std::memcpy( pWord, &Word, sizeof( Word ) );
  }

  uint8_t* const m_pPixels;
  const size_t m_Size;
  const uint64_t m_Width;
  const uint64_t m_Stride;
  std::array<uint32_t, GreyCount> m_Table{};   // U, Y and V, 10 bits each from the low end
};

struct VTextPlace
{
  uint64_t m_X;
  uint64_t m_Y;
  uint64_t m_ImageWidth;
};

// The background of a glyph is drawn too: text stands on a solid box.
template<class TPixels>
void DrawText( const VBurnInFont& i_rFont, std::string_view i_Text, const VTextPlace& i_rPlace, const TPixels& io_rPixels )
{
  for( size_t Index = 0; Index < i_Text.size(); ++Index )
  {
    const uint8_t* pGrey = i_rFont.Glyph( i_Text[Index] );
    for( uint32_t Row = 0; Row < i_rFont.Height(); ++Row )
    {
      const uint64_t First = ( i_rPlace.m_Y + Row ) * i_rPlace.m_ImageWidth + i_rPlace.m_X + Index * i_rFont.Width();
      for( uint32_t Column = 0; Column < i_rFont.Width(); ++Column )
      {
        io_rPixels.Paint( First + Column, *pGrey++ );
      }
    }
  }
}

bool IsBitPacked( IPixelFormat::Enum i_Format )
{
  return i_Format == IPixelFormat::EBayerGB7 || i_Format == IPixelFormat::EBayerGB6 || i_Format == IPixelFormat::ELuminance7 ||
    i_Format == IPixelFormat::ELuminance6;
}

}

bool BurnInText( KVZ::IPixelFormatConverter& i_rConverter, const KVZ::VideoFrameInfo& i_rInfo, uint32_t i_SizeIndex, uint32_t i_X, uint32_t i_Y,
  std::string_view i_Text, uint8_t* io_pPixels, size_t i_Size )
{
  if( i_Text.empty() )
  {
    return true;
  }
  const VTextPlace Place{ i_X, i_Y, i_rInfo.m_ImageWidth };
  const auto Draw = [&]( auto i_Pixels )
  {
    if( !i_Pixels.Prepare( i_rConverter, i_rInfo.m_PixelFormat ) )
    {
      return false;
    }
    DrawText( VBurnInFont( i_SizeIndex ), i_Text, Place, i_Pixels );
    return true;
  };
  const bool bPossible = i_rInfo.IsWhole() && !IsBitPacked( i_rInfo.m_PixelFormat );
  const bool bTenBit = i_rInfo.m_PixelFormat == IPixelFormat::EU10Y10V10Y10;
  if( bPossible && ( bTenBit ? Draw( VTenBitPixels( io_pPixels, i_Size, i_rInfo.m_ImageWidth ) ) : Draw( VBytePixels( io_pPixels, i_Size ) ) ) )
  {
    return true;
  }
  KVZ_LOG_ERROR( "CoreVideoUtils", "Text cannot be drawn into frames of the pixel format '%1%'.", KVZ::NameOrUnspecified( i_rInfo.m_PixelFormat ) );
  return false;
}

}
