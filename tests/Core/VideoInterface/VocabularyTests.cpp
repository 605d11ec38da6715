#include "Core/VideoInterface/Schemas.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <set>

using namespace KVZ;

namespace
{

// Names are told apart, come back as the value they stand for, and the schema says the same.
template<class TEnum>
void CheckTable( int32_t i_First, int32_t i_Last )
{
  const ISchema* pSchema = VSchemaOf<TEnum>::Get();
  ASSERT_NE( pSchema, nullptr );
  SCOPED_TRACE( pSchema->Name() );
  std::set<std::string> Names;
  for( int32_t Value = i_First; Value <= i_Last; ++Value )
  {
    const std::string Name = ToName( static_cast<TEnum>( Value ) );
    Names.insert( Name );
    TEnum Back{};
    EXPECT_TRUE( FromName( Name, Back ) );
    EXPECT_EQ( Back, Value );
    EXPECT_EQ( pSchema->NameFromValue( Value ), Name );
  }
  EXPECT_EQ( Names.size(), static_cast<size_t>( i_Last - i_First + 1 ) );
  EXPECT_EQ( Names.count( "" ), 0u );
  EXPECT_EQ( ToName( static_cast<TEnum>( i_Last + 1 ) ), "" );
  EXPECT_EQ( pSchema->Entries().size(), Names.size() );
  auto Kept = static_cast<TEnum>( i_First );
  EXPECT_FALSE( FromName( "NoSuchName", Kept ) );
  EXPECT_EQ( Kept, i_First );
}

}

TEST( Vocabulary, NamesAndSchemasAgree )
{
  CheckTable<IVideoStandard::Enum>( 0, 60 );
  CheckTable<IPixelFormat::Enum>( 0, 17 );
  CheckTable<IInterlacedFormat::Enum>( 0, 4 );
  CheckTable<IAudioSampleFormat::Enum>( 0, 9 );
  CheckTable<ITimecodeSource::Enum>( 0, 9 );
  CheckTable<ITimecodeStandard::Enum>( -1, 5 );
  CheckTable<IGenlockStandard::Enum>( 0, 16 );
  CheckTable<IVideoContainer::Enum>( 0, 5 );
  CheckTable<IVideoPayload::Enum>( 0, 5 );
  CheckTable<IAudioPayload::Enum>( 0, 2 );
  EXPECT_EQ( VSchemaOf<IGenlockStandard::Enum>::Get()->Name(), "DataStoreSystemSettings.EGenlockStandard" );
}

// The name spells width, height, scan and rate; the other columns are checked against it.
TEST( Vocabulary, VideoStandardsAreWhatTheirNamesSay )
{
  for( int32_t Value = 0; Value < VideoStandardCount - 1; ++Value )
  {
    const VVideoStandardRow& rRow = *FindVideoStandard( static_cast<IVideoStandard::Enum>( Value ) );
    SCOPED_TRACE( rRow.m_pName );
    unsigned Width = 0, Height = 0, Rate = 0;
    char Scan[4] = {};
    ASSERT_EQ( std::sscanf( rRow.m_pName, "%*2s_%u_%u%3[IPSF]_%u", &Width, &Height, Scan, &Rate ), 4 );
    EXPECT_EQ( rRow.m_Width, Width );
    EXPECT_EQ( rRow.m_Height, Height );
    const EScan Expected = Scan[0] == 'I' ? EScan::Interlaced : Scan[1] == 'S' ? EScan::SegmentedFrame : EScan::Progressive;
    EXPECT_EQ( rRow.m_Scan, Expected );
    EXPECT_EQ( rRow.m_Period == 0, Rate <= 1500 ) << "too slow for a period";
    if( rRow.m_Period != 0 )
    {
      // An interlaced name gives fields a second.
      const double FramesASecond = Rate / ( Expected == EScan::Interlaced ? 200.0 : 100.0 );
      EXPECT_NEAR( static_cast<double>( rRow.m_RateNumerator ) / rRow.m_RateDenominator, FramesASecond, 0.006 );
      EXPECT_EQ( rRow.m_Period * rRow.m_RateNumerator, int64_t{ 135000000 } * rRow.m_RateDenominator );
    }
  }
  EXPECT_EQ( GetFramePeriod( static_cast<IVideoStandard::Enum>( 61 ) ), 0 );
}

TEST( Vocabulary, DevicesLogTheStandardsWithoutAScan )
{
  std::set<int32_t> Logged;
  for( int32_t Value = -1; Value <= 61; ++Value )
  {
    const TestSupport::VLogCapture Log( "VideoCaptureDevice" );
    const auto Standard = static_cast<IVideoStandard::Enum>( Value );
    const bool bUnspecified = GetInterlacedFormat( Standard ) == IInterlacedFormat::EUnspecified;
    EXPECT_EQ( Log.Texts(), bUnspecified ? std::vector<std::string>{ "Invalid video standard." } : std::vector<std::string>{} );
    if( bUnspecified )
    {
      Logged.insert( Value );
    }
  }
  EXPECT_EQ( Logged, ( std::set<int32_t>{ -1, 1, 2, 4, 30, 31, 32, 60, 61 } ) );
  EXPECT_EQ( GetInterlacedFormat( IVideoStandard::EHD_1920_1080PSF_2500 ), IInterlacedFormat::ENotInterlaced );
  EXPECT_EQ( GetInterlacedFormat( IVideoStandard::ESD_720_576I_5000 ), IInterlacedFormat::EInterlacedFrameUnspecifiedLineTiming );
}

TEST( Vocabulary, PackedImagesRoundUpWhereTheirLayoutDoes )
{
  EXPECT_EQ( GetImageSize( IPixelFormat::EU10Y10V10Y10, 1280, 720 ), 27u * 128 * 720 );
  EXPECT_EQ( GetImageSize( IPixelFormat::EU10Y10V10Y10, 1920, 1080 ), 40u * 128 * 1080 );
  EXPECT_EQ( GetImageSize( IPixelFormat::EU10Y10V10Y10, 1, 1 ), 128u );
  EXPECT_EQ( GetImageSize( IPixelFormat::ELuminance7, 3, 3 ), 8u );   // 63 bits
  EXPECT_EQ( GetImageSize( IPixelFormat::EBayerGB6, 3, 3 ), 7u );     // 54 bits
  EXPECT_EQ( GetImageSize( IPixelFormat::ER8G8B8u8, 65536, 65536 ), uint64_t{ 1 } << 34 );
}
