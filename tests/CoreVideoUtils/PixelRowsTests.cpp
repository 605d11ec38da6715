#include "CoreVideoUtils/ColourRows.h"
#include "CoreVideoUtils/PixelRows.h"
#include "CoreVideoUtils/ReferencePixels.h"
#include "CoreVideoUtils/VectorTargets.h"
#include "tests/CoreVideoUtils/GuardedBytes.h"
#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>
#include <hwy/targets.h>

#include <numeric>
#include <random>
#include <vector>

using namespace CoreVideoUtils;
using KVZ::IPixelFormat;

namespace
{

using TestSupport::VBytes;

constexpr std::array ColourTargets = { IPixelFormat::ER8G8B8, IPixelFormat::EB8G8R8, IPixelFormat::ER8G8B8u8, IPixelFormat::EB8G8R8u8,
  IPixelFormat::EU8Y8V8Y8, IPixelFormat::EY8U8Y8V8 };

// All that the reference has a way for. Others are refused by both.
std::vector<VRowFormats> AllFormats()
{
  const std::array<uint8_t, 128> Source{};
  std::array<uint8_t, 128> Target{};
  std::vector<VRowFormats> All;
  for( int32_t Pair = 0; Pair < KVZ::PixelFormatCount * KVZ::PixelFormatCount; ++Pair )
  {
    const VRowFormats Formats = { static_cast<IPixelFormat::Enum>( Pair / KVZ::PixelFormatCount ),
      static_cast<IPixelFormat::Enum>( Pair % KVZ::PixelFormatCount ) };
    const bool bPossible = Reference::ConvertRow( Formats, Source.data(), Target.data(), 1 );
    EXPECT_EQ( bPossible, ConvertRow( Formats, Source.data(), Target.data(), 1 ) ) << Formats.m_Source << " to " << Formats.m_Target;
    if( bPossible )
    {
      All.push_back( Formats );
    }
  }
  EXPECT_EQ( All.size(), 58u );
  return All;
}

std::vector<size_t> Widths()
{
  std::vector<size_t> All( 68 );
  std::iota( All.begin(), All.end(), size_t{ 0 } );
  All.insert( All.end(), { 95, 96, 97, 129, 161, 1919, 1920, 1921, 1968, 4096 } );
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

// Enough to hold nearly every pair of values, as one of U and one of V, several times.
TEST_P( PixelRows, EqualTheReferenceForAMillionColours )
{
  constexpr size_t Pixels = 48 << 15;
  for( const VRowFormats Formats :
    { VRowFormats{ IPixelFormat::EU8Y8V8Y8, IPixelFormat::EB8G8R8u8 }, { IPixelFormat::ER8G8B8, IPixelFormat::EU8Y8V8Y8 },
      { IPixelFormat::ER8G8B8, IPixelFormat::ELuminance8 }, { IPixelFormat::EU10Y10V10Y10, IPixelFormat::ER8G8B8u8 } } )
  {
    const VBytes Source = TestSupport::Noise( RowSize( Formats.m_Source, Pixels ), 4 );
    VBytes Target( RowSize( Formats.m_Target, Pixels ) );
    VBytes Expected( Target.size() );
    ASSERT_TRUE( ConvertRow( Formats, Source.data(), Target.data(), Pixels ) );
    ASSERT_TRUE( Reference::ConvertRow( Formats, Source.data(), Expected.data(), Pixels ) );
    EXPECT_TRUE( Target == Expected ) << Formats.m_Source << " to " << Formats.m_Target;
  }
}

// Five rows with their borders, and behind them what may be read
class VMosaicRows
{
public:
  VMosaicRows( size_t i_Width, std::mt19937& io_rRandom, bool i_bExtremes )
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

void CompareMosaicRow( size_t i_Width, VBayerRow i_Row, const VMosaicRows& i_rMosaic )
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
      const VMosaicRows Mosaic( Width, Random, ( Kind & 4 ) != 0 );
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

}
