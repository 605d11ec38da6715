#include "StageCoreRuntime/Variant.h"
#include "StageCoreDataStoreTypes/GreyscaleMode.h"
#include "StageCoreDataStoreTypes/MaskGrid.h"
#include "tests/support/AssertionCapture.h"
#include "tests/support/Threads.h"

#include <gtest/gtest.h>

#include <boost/thread/barrier.hpp>

#include <limits>
#include <set>

namespace
{
using CoreTarvoTypesUtils::EGreyscaleMode;
using KVZ::ISchema;
using KVZ::Variant;

VMaskGrid ExampleGrid() { return { "vi:\"0\"", 4, 5, 480, 270, { 1, 0xffffffff } }; }

TEST( Schema, IsUniqueAcrossThreads )
{
  constexpr int ThreadCount = 4;
  constexpr int NameCount = 50;
  boost::barrier Barrier( ThreadCount );
  std::array<std::vector<const ISchema*>, ThreadCount> Found;
  const auto Ask = [&]( uint32_t i_Thread )
  {
    Barrier.wait();
    for( int Name = 0; Name < NameCount; ++Name )
    {
      const std::vector<ISchema::VEntry> Entries{ { Name, "N", "" } };
      Found[i_Thread].push_back( KVZ::IO::GetUniqueSchema( "VariantTest.Unique" + std::to_string( Name ), "", Entries ) );
    }
    Found[i_Thread].push_back( KVZ::IO::GetUniquePodSchema( ISchema::EDouble ) );
  };
  TestSupport::RunOnThreads( ThreadCount, Ask );
  for( const auto& rFound : Found )
  {
    EXPECT_EQ( rFound, Found[0] );
  }
  EXPECT_EQ( std::set<const ISchema*>( Found[0].begin(), Found[0].end() ).size(), NameCount + 1u );
  EXPECT_EQ( KVZ::IO::GetUniqueSchema( "VariantTest.Unique7" ), Found[0][7] );
  EXPECT_EQ( KVZ::IO::GetUniqueSchema( "VariantTest.Nobody" ), nullptr );
}

TEST( Schema, KeepsTheFirstContentOfANameAndAssertsOnAnother )
{
  const ISchema* pFirst = KVZ::IO::GetUniqueSchema( "VariantTest.Twice", "", std::vector<ISchema::VEntry>{ { 1, "One", "" } } );
  const TestSupport::VAssertionCapture Assertions;
  EXPECT_EQ( KVZ::IO::GetUniqueSchema( "VariantTest.Twice", "", std::vector<ISchema::VEntry>{ { 1, "One", "" } } ), pFirst );
  EXPECT_EQ( Assertions.Expressions().size(), 0u );
  EXPECT_EQ( KVZ::IO::GetUniqueSchema( "VariantTest.Twice", "", std::vector<ISchema::VEntry>{ { 2, "One", "" } } ), pFirst );
  EXPECT_EQ( Assertions.Expressions().size(), 1u );
  EXPECT_EQ( pFirst->ValueFromName( "One" ), 1 );
}

template<class T>
void ExpectRoundTrip( const T& i_rValue, ISchema::EType i_Type, size_t i_Bytes )
{
  SCOPED_TRACE( i_Type );
  const Variant Value = Variant::Make( i_rValue );
  EXPECT_EQ( Value.Schema(), KVZ::IO::GetUniquePodSchema( i_Type ) );
  EXPECT_EQ( Value.Bytes().size(), i_Bytes );
  T Read{};
  EXPECT_TRUE( Value.Get( Read ) );
  EXPECT_EQ( Read, i_rValue );
  const auto FromText = Variant::FromText( Value.Schema(), Value.ToText() );
  EXPECT_TRUE( FromText && *FromText == Value ) << Value.ToText();
}

TEST( Variant, PlainValuesComeBackFromBytesAndText )
{
  ExpectRoundTrip( true, ISchema::EBool, 1 );
  ExpectRoundTrip( std::numeric_limits<int8_t>::min(), ISchema::EInt8, 1 );
  ExpectRoundTrip( std::numeric_limits<int16_t>::min(), ISchema::EInt16, 2 );
  ExpectRoundTrip( std::numeric_limits<int32_t>::min(), ISchema::EInt32, 4 );
  ExpectRoundTrip( std::numeric_limits<int64_t>::min(), ISchema::EInt64, 8 );
  ExpectRoundTrip( std::numeric_limits<uint8_t>::max(), ISchema::EUInt8, 1 );
  ExpectRoundTrip( std::numeric_limits<uint16_t>::max(), ISchema::EUInt16, 2 );
  ExpectRoundTrip( std::numeric_limits<uint32_t>::max(), ISchema::EUInt32, 4 );
  ExpectRoundTrip( std::numeric_limits<uint64_t>::max(), ISchema::EUInt64, 8 );
  ExpectRoundTrip( 29.97f, ISchema::EFloat, 4 );
  ExpectRoundTrip( -0.1, ISchema::EDouble, 8 );
  ExpectRoundTrip( std::string( "with \0 and %s", 13 ), ISchema::EString, 13 );
  ExpectRoundTrip( std::string(), ISchema::EString, 0 );
}

TEST( Variant, EnumerationsGoByName )
{
  const Variant Value = Variant::Make( EGreyscaleMode::EOnly );
  EXPECT_EQ( Value.Bytes(), ( Variant::VBytes{ 2, 0, 0, 0 } ) );
  EXPECT_EQ( Value.ToText(), "Only" );
  EXPECT_EQ( Variant::FromText( Value.Schema(), "Only" ), Value );
  EXPECT_EQ( Variant::FromText( Value.Schema(), "only" ), std::nullopt );
  EXPECT_EQ( Variant::FromText( Value.Schema(), "" ), std::nullopt );
  EXPECT_EQ( Variant::MakeEnumeration( Value.Schema(), 9 ).ToText(), "9" );
  int32_t Number = 0;
  EXPECT_FALSE( Variant().Get( Number ) );
  EXPECT_TRUE( Value.GetEnumeration( Number ) );
  // The bytes fit, the schema does not.
  EXPECT_FALSE( Value.Get( Number ) );
  EXPECT_FALSE( Variant::Make( int32_t( 1 ) ).GetEnumeration( Number ) );
  EXPECT_EQ( Number, 2 );
}

TEST( Variant, RecordsComeBackAndBrokenOnesAreRefused )
{
  const Variant Value = Variant::Make( ExampleGrid() );
  VMaskGrid Read;
  ASSERT_TRUE( Value.Get( Read ) );
  EXPECT_EQ( Read, ExampleGrid() );
  EXPECT_EQ( Value.ToText(), R"({DeviceURN: "vi:\"0\"", TileSizeX: 4, TileSizeY: 5, GridSizeX: 480, GridSizeY: 270, RunLengths: [1, 4294967295]})" );
  EXPECT_EQ( Variant::Make( std::vector<std::string>{ "", "a" } ).ToText(), R"(["", "a"])" );

  for( size_t Size = 0; Size < Value.Bytes().size(); ++Size )
  {
    SCOPED_TRACE( Size );
    const Variant Short( Value.Schema(), Variant::VBytes( Value.Bytes().begin(), Value.Bytes().begin() + static_cast<std::ptrdiff_t>( Size ) ) );
    VMaskGrid Untouched;
    EXPECT_FALSE( Short.Get( Untouched ) );
    EXPECT_EQ( Untouched, VMaskGrid() );
    EXPECT_EQ( Short.ToText(), "?" );
  }
  Variant::VBytes Long = Value.Bytes();
  Long.push_back( 0 );
  EXPECT_FALSE( Variant( Value.Schema(), Long ).Get( Read ) );
  // A length of 4 GiB in a value of a few bytes
  Variant::VBytes Huge = Value.Bytes();
  std::fill_n( Huge.begin(), 4, uint8_t( 0xff ) );
  EXPECT_FALSE( Variant( Value.Schema(), Huge ).Get( Read ) );
}

TEST( Variant, TextThatIsNoValueIsRefused )
{
  const auto Parse = []( ISchema::EType i_Type, const char* i_pText ) { return Variant::FromText( KVZ::IO::GetUniquePodSchema( i_Type ), i_pText ); };
  EXPECT_EQ( Parse( ISchema::EBool, "0" ), Variant::Make( false ) );
  EXPECT_EQ( Parse( ISchema::EDouble, "1e3" ), Variant::Make( 1000.0 ) );
  for( const char* pText : { "", " 1", "1 ", "1x", "x", "256", "-1", "1.5" } )
  {
    EXPECT_EQ( Parse( ISchema::EUInt8, pText ), std::nullopt ) << pText;
  }
  EXPECT_EQ( Parse( ISchema::EBool, "maybe" ), std::nullopt );
  EXPECT_EQ( Parse( ISchema::EDouble, "1,5" ), std::nullopt );
  EXPECT_EQ( Variant::FromText( nullptr, "1" ), std::nullopt );
  EXPECT_EQ( Variant::FromText( KVZ::VSchemaOf<VMaskGrid>::Get(), "{}" ), std::nullopt );
}

TEST( Variant, LabelledListsHoldValuesOfOneSchema )
{
  const std::vector<std::vector<KVZ::VLabelledVariant>> Lists = {
    { { "Default", Variant::Make( "" ) }, { "Disk", Variant::Make( "/mnt/a" ) } },
    { { "Two", Variant::Make( uint32_t( 2 ) ) }, { "", Variant::Make( uint32_t( 16 ) ) } },
    { { "A mode", Variant::Make( EGreyscaleMode::EOnly ) } },
    { { "On", Variant::Make( true ) } },
    { { "A grid", Variant::Make( ExampleGrid() ) }, { "Another", Variant::Make( VMaskGrid() ) } },
  };
  for( const auto& rChoices : Lists )
  {
    SCOPED_TRACE( rChoices[0].m_Label );
    const Variant List = KVZ::MakeLabelledList( rChoices[0].m_Value.Schema(), rChoices );
    std::vector<KVZ::VLabelledVariant> Read;
    EXPECT_TRUE( KVZ::GetLabelledList( List, Read ) );
    EXPECT_EQ( Read, rChoices );
    EXPECT_FALSE( KVZ::GetLabelledList( Variant( List.Schema(), { 9, 0, 0, 0 } ), Read ) );
    EXPECT_EQ( Read, rChoices );
    EXPECT_NE( List.ToText(), "?" );
  }
  EXPECT_TRUE( KVZ::MakeLabelledList( KVZ::VSchemaOf<double>::Get(), Lists[1] ).IsEmpty() );
  std::vector<KVZ::VLabelledVariant> Read;
  EXPECT_FALSE( KVZ::GetLabelledList( Variant::Make( std::vector<uint32_t>{ 1 } ), Read ) );
  EXPECT_FALSE( KVZ::GetLabelledList( Variant(), Read ) );
}
}
