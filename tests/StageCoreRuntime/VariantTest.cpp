#include "StageCoreRuntime/Variant.h"
#include "tests/support/AssertionCapture.h"

#include <gtest/gtest.h>

#include <boost/thread/barrier.hpp>
#include <boost/thread/thread.hpp>

#include <limits>
#include <set>

namespace VariantTest
{
enum EFruit : int32_t
{
  None = -1,
  Apple = 0,
  Pear = 5,
};

struct VGrid
{
  std::string m_DeviceURN;
  uint32_t m_TileSizeX = 0;
  std::vector<uint32_t> m_RunLengths;
  std::vector<std::string> m_Names;
  bool m_bOn = false;
  EFruit m_Fruit = None;
  bool operator==( const VGrid& ) const = default;
};
}

namespace KVZ
{
template<>
struct VSchemaOf<VariantTest::EFruit>
{
  static const ISchema* Get()
  {
    return IO::GetUniqueSchema( "VariantTest.Fruit", "Fruit.",
      std::vector<ISchema::VEntry>{ { -1, "None", "Nothing." }, { 0, "Apple", "Round." }, { 5, "Pear", "Less round." } } );
  }
};

template<>
struct VSchemaOf<VariantTest::VGrid>
{
  static const ISchema* Get()
  {
    return IO::GetUniqueSchema( "VariantTest.Grid", "",
      std::vector<ISchema::VField>{ { "DeviceURN", VSchemaOf<std::string>::Get() }, { "TileSizeX", VSchemaOf<uint32_t>::Get() },
        { "RunLengths", VSchemaOf<std::vector<uint32_t>>::Get() }, { "Names", VSchemaOf<std::vector<std::string>>::Get() },
        { "On", VSchemaOf<bool>::Get() }, { "Fruit", VSchemaOf<VariantTest::EFruit>::Get() } } );
  }

  template<class TGrid, class TVisitor>
  static void Visit( TGrid& i_rGrid, TVisitor& i_rVisitor )
  {
    i_rVisitor( i_rGrid.m_DeviceURN );
    i_rVisitor( i_rGrid.m_TileSizeX );
    i_rVisitor( i_rGrid.m_RunLengths );
    i_rVisitor( i_rGrid.m_Names );
    i_rVisitor( i_rGrid.m_bOn );
    i_rVisitor( i_rGrid.m_Fruit );
  }
};
}

namespace
{
using namespace VariantTest;
using KVZ::ISchema;
using KVZ::Variant;

VGrid ExampleGrid() { return { "vi:0", 4, { 1, 0xffffffff }, { "", "a \"b\"" }, true, Pear }; }

TEST( Schema, IsUniqueAcrossThreads )
{
  constexpr int ThreadCount = 4;
  constexpr int NameCount = 50;
  boost::barrier Barrier( ThreadCount );
  std::array<std::vector<const ISchema*>, ThreadCount> Found;
  boost::thread_group Threads;
  for( auto& rFound : Found )
  {
    Threads.create_thread(
      [&]
      {
        Barrier.wait();
        for( int Name = 0; Name < NameCount; ++Name )
        {
          const std::vector<ISchema::VEntry> Entries{ { Name, "N", "" } };
          rFound.push_back( KVZ::IO::GetUniqueSchema( "VariantTest.Unique" + std::to_string( Name ), "", Entries ) );
        }
        rFound.push_back( KVZ::IO::GetUniquePodSchema( ISchema::EDouble ) );
      } );
  }
  Threads.join_all();
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
  const Variant Value = Variant::Make( Pear );
  EXPECT_EQ( Value.Bytes(), ( Variant::VBytes{ 5, 0, 0, 0 } ) );
  EXPECT_EQ( Value.ToText(), "Pear" );
  EXPECT_EQ( Variant::FromText( Value.Schema(), "Pear" ), Value );
  EXPECT_EQ( Variant::FromText( Value.Schema(), "pear" ), std::nullopt );
  EXPECT_EQ( Variant::FromText( Value.Schema(), "" ), std::nullopt );
  EXPECT_EQ( Variant::MakeEnumeration( Value.Schema(), 3 ).ToText(), "3" );
  int32_t Number = 0;
  EXPECT_FALSE( Variant().Get( Number ) );
  EXPECT_TRUE( Value.GetEnumeration( Number ) );
  // The bytes fit, the schema does not.
  EXPECT_FALSE( Value.Get( Number ) );
  EXPECT_FALSE( Variant::Make( int32_t( 1 ) ).GetEnumeration( Number ) );
  EXPECT_EQ( Number, 5 );
}

TEST( Variant, RecordsComeBackAndBrokenOnesAreRefused )
{
  const Variant Value = Variant::Make( ExampleGrid() );
  VGrid Read;
  ASSERT_TRUE( Value.Get( Read ) );
  EXPECT_EQ( Read, ExampleGrid() );
  EXPECT_EQ( Value.ToText(), R"({DeviceURN: "vi:0", TileSizeX: 4, RunLengths: [1, 4294967295], Names: ["", "a \"b\""], On: true, Fruit: Pear})" );

  for( size_t Size = 0; Size < Value.Bytes().size(); ++Size )
  {
    SCOPED_TRACE( Size );
    const Variant Short( Value.Schema(), Variant::VBytes( Value.Bytes().begin(), Value.Bytes().begin() + static_cast<std::ptrdiff_t>( Size ) ) );
    VGrid Untouched;
    EXPECT_FALSE( Short.Get( Untouched ) );
    EXPECT_EQ( Untouched, VGrid() );
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
  EXPECT_EQ( Variant::FromText( KVZ::VSchemaOf<VGrid>::Get(), "{}" ), std::nullopt );
}

TEST( Variant, LabelledListsHoldValuesOfOneSchema )
{
  const std::vector<std::vector<KVZ::VLabelledVariant>> Lists = {
    { { "Default", Variant::Make( "" ) }, { "Disk", Variant::Make( "/mnt/a" ) } },
    { { "Two", Variant::Make( uint32_t( 2 ) ) }, { "", Variant::Make( uint32_t( 16 ) ) } },
    { { "A pear", Variant::Make( Pear ) } },
    { { "A grid", Variant::Make( ExampleGrid() ) }, { "Another", Variant::Make( VGrid() ) } },
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
