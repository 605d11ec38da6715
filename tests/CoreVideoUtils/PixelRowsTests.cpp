#include "CoreVideoUtils/ColourRows.h"
#include "CoreVideoUtils/PixelRows.h"
#include "CoreVideoUtils/ReferencePixels.h"
#include "CoreVideoUtils/VectorTargets.h"
#include "tests/CoreVideoUtils/GuardedBytes.h"

#include <gtest/gtest.h>
#include <hwy/targets.h>

#include <random>
#include <vector>

using namespace CoreVideoUtils;
using KVZ::IPixelFormat;

namespace
{

using VBytes = std::vector<uint8_t>;

constexpr std::array Sources = { IPixelFormat::ER8G8B8, IPixelFormat::EB8G8R8, IPixelFormat::ER8G8B8u8, IPixelFormat::EB8G8R8u8,
  IPixelFormat::ER5G6B5, IPixelFormat::ELuminance8, IPixelFormat::EU8Y8V8Y8, IPixelFormat::EY8U8Y8V8, IPixelFormat::EU10Y10V10Y10 };
constexpr std::array ColourTargets = { IPixelFormat::ER8G8B8, IPixelFormat::EB8G8R8, IPixelFormat::ER8G8B8u8, IPixelFormat::EB8G8R8u8,
  IPixelFormat::EU8Y8V8Y8, IPixelFormat::EY8U8Y8V8 };

bool IsPairs( IPixelFormat::Enum i_Format ) { return i_Format == IPixelFormat::EU8Y8V8Y8 || i_Format == IPixelFormat::EY8U8Y8V8; }

std::vector<VRowFormats> AllFormats()
{
  std::vector<VRowFormats> All;
  for( const IPixelFormat::Enum Source : Sources )
  {
    for( const IPixelFormat::Enum Target : ColourTargets )
    {
      if( Source != Target )
      {
        All.push_back( { Source, Target } );
      }
    }
    if( Source != IPixelFormat::ELuminance8 )
    {
      All.push_back( { Source, IPixelFormat::ELuminance8 } );
    }
    if( IsPairs( Source ) )
    {
      All.push_back( { Source, IPixelFormat::EU10Y10V10Y10 } );
    }
  }
  return All;
}

std::vector<size_t> Widths()
{
  std::vector<size_t> All;
  for( size_t Width = 0; Width <= 67; ++Width )
  {
    All.push_back( Width );
  }
  for( const size_t Width : { 95, 96, 97, 129, 161, 1919, 1920, 1921, 1968, 4096 } )
  {
    All.push_back( Width );
  }
  return All;
}

// Anything, or nothing but what lies at the ends of the range.
void Fill( uint8_t* o_pBytes, size_t i_Size, std::mt19937& io_rRandom, bool i_bExtremes )
{
  constexpr std::array<uint8_t, 6> Extremes = { 0, 255, 1, 254, 127, 128 };
  for( size_t Byte = 0; Byte < i_Size; ++Byte )
  {
    const auto Value = static_cast<uint32_t>( io_rRandom() );
    o_pBytes[Byte] = i_bExtremes ? Extremes[Value % Extremes.size()] : static_cast<uint8_t>( Value >> 8 );
  }
}

size_t RowSize( IPixelFormat::Enum i_Format, size_t i_Width )
{
  return static_cast<size_t>( KVZ::GetImageSize( i_Format, static_cast<uint32_t>( i_Width ), 1 ) );
}

// Runs each test with every kind of vectors that this processor has.
class PixelRows : public testing::TestWithParam<int64_t>
{
protected:
  void SetUp() override { hwy::SetSupportedTargetsForTest( GetParam() ); }
  void TearDown() override { hwy::SetSupportedTargetsForTest( 0 ); }
};

std::vector<int64_t> TargetsHere()
{
  hwy::SetSupportedTargetsForTest( 0 );
  std::vector<int64_t> Here;
  for( const int64_t Target : { int64_t{ HWY_SSE4 }, int64_t{ HWY_AVX2 }, int64_t{ HWY_AVX3 }, int64_t{ HWY_SCALAR } } )
  {
    if( ( hwy::SupportedTargets() & Target ) != 0 )
    {
      Here.push_back( Target );
    }
  }
  return Here;
}

INSTANTIATE_TEST_SUITE_P( Vectors, PixelRows, testing::ValuesIn( TargetsHere() ),
  []( const testing::TestParamInfo<int64_t>& i_rInfo ) { return std::string( hwy::TargetName( i_rInfo.param ) ); } );

void CompareRow( VRowFormats i_Formats, size_t i_Width, std::mt19937& io_rRandom, bool i_bExtremes )
{
  SCOPED_TRACE( KVZ::ToName( i_Formats.m_Source ) + " to " + KVZ::ToName( i_Formats.m_Target ) + ", " + std::to_string( i_Width ) );
  VGuardedBytes Source( RowSize( i_Formats.m_Source, i_Width ) );
  VGuardedBytes Target( RowSize( i_Formats.m_Target, i_Width ) );
  VGuardedBytes Expected( Target.Size() );
  Fill( Source.Data(), Source.Size(), io_rRandom, i_bExtremes );
  ASSERT_TRUE( ConvertRow( i_Formats, Source.Data(), Target.Data(), i_Width ) );
  ASSERT_TRUE( Reference::ConvertRow( i_Formats, Source.Data(), Expected.Data(), i_Width ) );
  ASSERT_TRUE( Target == Expected );
  ASSERT_TRUE( Target.IsFrontWhole() && Source.IsFrontWhole() );
}

void CompareAll( VRowFormats i_Formats, const VBytes& i_rSource, size_t i_Pixels )
{
  VBytes Target( i_Pixels * 4 );
  VBytes Expected( i_Pixels * 4 );
  ASSERT_TRUE( ConvertRow( i_Formats, i_rSource.data(), Target.data(), i_Pixels ) );
  ASSERT_TRUE( Reference::ConvertRow( i_Formats, i_rSource.data(), Expected.data(), i_Pixels ) );
  EXPECT_TRUE( Target == Expected ) << i_Formats.m_Target;
}

TEST_P( PixelRows, EqualTheReferenceAtEveryWidth )
{
  std::mt19937 Random( 1 );
  for( const VRowFormats Formats : AllFormats() )
  {
    for( const size_t Width : Widths() )
    {
      CompareRow( Formats, Width, Random, false );
      CompareRow( Formats, Width, Random, true );
      if( HasFatalFailure() )
      {
        return;
      }
    }
  }
}

// Every U with every V, at the ends of Y and in its middle; every Y with every U and V follows, as each channel has Y as a summand of its own.
TEST_P( PixelRows, EqualTheReferenceForAllChroma )
{
  VBytes Pairs;
  for( const uint8_t Luma : { 0, 77, 130, 255 } )
  {
    for( int Value = 0; Value < 65536; ++Value )
    {
      Pairs.insert( Pairs.end(), { static_cast<uint8_t>( Value ), Luma, static_cast<uint8_t>( Value >> 8 ), static_cast<uint8_t>( Value + Luma ) } );
    }
  }
  CompareAll( { IPixelFormat::EU8Y8V8Y8, IPixelFormat::EB8G8R8u8 }, Pairs, Pairs.size() / 2 );
}

TEST_P( PixelRows, EqualTheReferenceForAllColours )
{
  VBytes Colours;
  for( const uint8_t Blue : { 0, 1, 100, 254, 255 } )
  {
    for( int Value = 0; Value < 65536; ++Value )
    {
      // Twice, as a pixel keeps U or V by its place
      const std::array<uint8_t, 3> Colour = { static_cast<uint8_t>( Value ), static_cast<uint8_t>( Value >> 8 ), Blue };
      Colours.insert( Colours.end(), Colour.begin(), Colour.end() );
      Colours.insert( Colours.end(), Colour.begin(), Colour.end() );
    }
  }
  CompareAll( { IPixelFormat::ER8G8B8, IPixelFormat::EU8Y8V8Y8 }, Colours, Colours.size() / 3 );
  CompareAll( { IPixelFormat::ER8G8B8, IPixelFormat::ELuminance8 }, Colours, Colours.size() / 3 );
}

TEST_P( PixelRows, EqualTheReferenceForAllTenBitChroma )
{
  VBytes Words;
  for( uint32_t First = 0; First < 1024; First += 5 )
  {
    for( uint32_t Second = 0; Second < 1024; Second += 3 )
    {
      const uint32_t Other = 1023 - First;
      for( const uint32_t Word :
        { First | 1023U << 10 | Second << 20, First << 10 | Other << 20, Second | Other << 10 | Second << 20, Other | First << 10 | Second << 20 } )
      {
        Words.insert( Words.end(),
          { static_cast<uint8_t>( Word ), static_cast<uint8_t>( Word >> 8 ), static_cast<uint8_t>( Word >> 16 ),
            static_cast<uint8_t>( Word >> 24 ) } );
      }
    }
  }
  Words.resize( Words.size() / 128 * 128 );
  CompareAll( { IPixelFormat::EU10Y10V10Y10, IPixelFormat::ER8G8B8u8 }, Words, Words.size() / 128 * 48 );
}

// Five rows with their borders, and behind them what may be read
class VMosaic
{
public:
  VMosaic( size_t i_Width, std::mt19937& io_rRandom, bool i_bExtremes )
    : m_Stride( BayerBorder + i_Width + BayerBorder + BayerSlack ), m_Bytes( 5 * m_Stride )
  {
    Fill( m_Bytes.Data(), m_Bytes.Size(), io_rRandom, i_bExtremes );
  }
  const uint8_t* Row( size_t i_Row ) const { return m_Bytes.Data() + i_Row * m_Stride + BayerBorder; }
  std::array<const uint8_t*, 5> Five() const { return { Row( 0 ), Row( 1 ), Row( 2 ), Row( 3 ), Row( 4 ) }; }
  std::array<const uint8_t*, 3> Three() const { return { Row( 1 ), Row( 2 ), Row( 3 ) }; }

private:
  const size_t m_Stride;
  VGuardedBytes m_Bytes;
};

void CompareMosaicRow( size_t i_Width, VBayerRow i_Row, const VMosaic& i_rMosaic )
{
  for( const IPixelFormat::Enum Format : ColourTargets )
  {
    SCOPED_TRACE( KVZ::ToName( Format ) + ", " + std::to_string( i_Width ) );
    VGuardedBytes Target( RowSize( Format, i_Width ) );
    VGuardedBytes Expected( Target.Size() );
    ASSERT_TRUE( DemosaicRow( i_rMosaic.Five(), i_Row, Format, Target.Data(), i_Width ) );
    ASSERT_TRUE( Reference::DemosaicRow( i_rMosaic.Five(), i_Row, Format, Expected.Data(), i_Width ) );
    ASSERT_TRUE( Target == Expected && Target.IsFrontWhole() );
  }
  VGuardedBytes Grey( i_Width );
  VGuardedBytes ExpectedGrey( i_Width );
  FilterBayerRow( i_rMosaic.Three(), i_Row, Grey.Data(), i_Width );
  Reference::FilterBayerRow( i_rMosaic.Three(), i_Row, ExpectedGrey.Data(), i_Width );
  ASSERT_TRUE( Grey == ExpectedGrey && Grey.IsFrontWhole() ) << i_Width;
}

TEST_P( PixelRows, EqualTheReferenceForBayerRows )
{
  std::mt19937 Random( 2 );
  for( const size_t Width : Widths() )
  {
    for( unsigned Kind = 0; Kind < 8; ++Kind )
    {
      const VBayerRow Row = { ( Kind & 1 ) != 0, ( Kind & 2 ) != 0 };
      const VMosaic Mosaic( Width, Random, ( Kind & 4 ) != 0 );
      CompareMosaicRow( Width, Row, Mosaic );
      if( HasFatalFailure() )
      {
        return;
      }
    }
  }
}

TEST_P( PixelRows, EqualTheReferenceInSaturation )
{
  std::mt19937 Random( 3 );
  for( const size_t Width : Widths() )
  {
    for( const size_t BytesPerPixel : { 3U, 4U } )
    {
      for( const float Amount : { 1.0f, 0.3f, -0.7f, -65536.0f } )
      {
        VGuardedBytes Pixels( Width * BytesPerPixel );
        VGuardedBytes Expected( Pixels.Size() );
        Fill( Pixels.Data(), Pixels.Size(), Random, false );
        std::copy_n( Pixels.Data(), Pixels.Size(), Expected.Data() );
        MoveToMean( Amount, Pixels.Data(), Width, BytesPerPixel );
        Reference::MoveToMean( Amount, Expected.Data(), Width, BytesPerPixel );
        ASSERT_TRUE( Pixels == Expected && Pixels.IsFrontWhole() ) << Width << " by " << Amount;
      }
    }
  }
}

TEST_P( PixelRows, RefuseOtherFormats )
{
  uint8_t Source[128] = {};
  uint8_t Target[128] = {};
  for( const VRowFormats Formats : { VRowFormats{ IPixelFormat::ER8G8B8, IPixelFormat::EU10Y10V10Y10 },
         VRowFormats{ IPixelFormat::EBayerRG8, IPixelFormat::ER8G8B8 }, VRowFormats{ IPixelFormat::ER8G8B8, IPixelFormat::ER5G6B5 },
         VRowFormats{ IPixelFormat::EU10Y10V10Y10, IPixelFormat::EUnspecified }, VRowFormats{ IPixelFormat::EU8Y8V8Y8, IPixelFormat::EU8Y8V8Y8 } } )
  {
    EXPECT_FALSE( ConvertRow( Formats, Source, Target, 1 ) );
    EXPECT_FALSE( Reference::ConvertRow( Formats, Source, Target, 1 ) );
  }
  const std::array<const uint8_t*, 5> Rows = { Source + 2, Source + 2, Source + 2, Source + 2, Source + 2 };
  EXPECT_FALSE( DemosaicRow( Rows, {}, IPixelFormat::ELuminance8, Target, 1 ) );
}

}
