// What the system's own container keeps of a recording beside its frames, found again in each of the others.
#include "tests/FileIO/Containers/MovieWriters.h"
#include "tests/support/EbmlParser.h"
#include "tests/support/MovParser.h"
#include "tests/support/RiffParser.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"

#include <gtest/gtest.h>

using namespace Containers;
using namespace TestSupport;

namespace
{

// A value of each type. Times count in the base of MOV files, so that all containers can keep the same.
VHeader Recording()
{
  VHeader Settings = MovieHeader( 4, 2 );
  Settings.m_Timing = { 1080000000, 36036000, -720720000 };
  Settings.m_Timecode = { KVZ::ITimecodeStandard::ETimecode30Drop, 10, 11, 12, 13 };
  Settings.m_Colour = { 0.75f, 2.2f };
  KVZ::IVideoAttributes& rAttributes = Settings.m_Attributes;
  rAttributes.Set( "Bool", true );
  rAttributes.Set( "Int8", char{ -128 } );
  rAttributes.Set( "Int16", int16_t{ -32768 } );
  rAttributes.Set( "Int32", int32_t{ -2147483647 } );
  rAttributes.Set( "Int64", int64_t{ -9007199254740993 } );
  rAttributes.Set( "UInt8", uint8_t{ 255 } );
  rAttributes.Set( "UInt16", uint16_t{ 65535 } );
  rAttributes.Set( "UInt32", uint32_t{ 4294967295 } );
  rAttributes.Set( "UInt64", uint64_t{ 18446744073709551615u } );
  rAttributes.Set( "Float", 0.1f );
  rAttributes.Set( "Double", 0.1 );
  rAttributes.Set( "Text", std::string( "Bühne 1, \"links\"" ) );
  rAttributes.Set( "Empty", std::string() );
  return Settings;
}

class Attributes : public testing::Test
{
protected:
  std::string Write( const VContainerRow& i_rRow ) const
  {
    const std::string Path = m_Folder.File( std::string( "movie." ) + i_rRow.m_pName );
    const VHeader Settings = Recording();
    const auto pWriter = MakeWriter( i_rRow.m_Container );
    EXPECT_TRUE( pWriter->Open( Path ) && Settings.WriteTo( *pWriter ) );
    EXPECT_TRUE( Settings.WriteFrame( *pWriter, VBytes( 16 ), VBytes( 8 ), 0 ) );
    EXPECT_TRUE( pWriter->Close() );
    return Path;
  }

  // Both blocks as they lie in the file, the internal one first.
  VBytes ReferenceBlocks() const
  {
    constexpr std::ptrdiff_t FixedHeader = 48;
    const VBytes File = VRiffParser::ReadFile( m_Reference );
    return { File.begin() + FixedHeader, File.begin() + static_cast<std::ptrdiff_t>( VTvidParser( m_Reference ).RecordsStart() ) };
  }

  const VTemporaryFolder m_Folder;
  const std::string m_Reference = Write( { "tvid", KVZ::IVideoContainer::ETVID } );
};

bool IsText( const VTvidParser::VValue& i_rValue, const std::string& i_rText )
{
  struct VVisitor
  {
    bool operator()( bool i_bValue ) const { return m_rText == ( i_bValue ? "true" : "false" ); }
    bool operator()( int64_t i_Value ) const { return m_rText == std::to_string( i_Value ); }
    bool operator()( uint64_t i_Value ) const { return m_rText == std::to_string( i_Value ); }
    bool operator()( double i_Value ) const { return std::stod( m_rText ) == i_Value || double{ std::stof( m_rText ) } == i_Value; }
    bool operator()( const std::string& i_rValue ) const { return m_rText == i_rValue; }
    const std::string& m_rText;
  };
  return std::visit( VVisitor{ i_rText }, i_rValue );
}

}

TEST_F( Attributes, OfMovAndMP4AreTheSameBytes )
{
  for( const VContainerRow& rRow : { Mov, MP4 } )
  {
    const auto File = VMovParser::OfFile( Write( rRow ) );
    EXPECT_EQ( File.Body( File.Root().Child( "TMSL" ) ), ReferenceBlocks() ) << rRow.m_pName;
  }
}

TEST_F( Attributes, OfAviAreTheSameBytes )
{
  const VRiffParser File( VRiffParser::ReadFile( Write( Avi ) ) );
  ASSERT_EQ( File.Riffs().back().m_Form, "TMSL" );
  EXPECT_EQ( File.Content( File.Riffs().back() ), ReferenceBlocks() );
}

TEST_F( Attributes, OfMatroskaAreTheSameValues )
{
  const VEbmlParser File( VRiffParser::ReadFile( Write( Mkv ) ) );
  std::map<std::string, std::string> Tags = ReadTags( File );
  const VTvidParser Reference( m_Reference );
  EXPECT_EQ( Tags.size(), Reference.Internal().size() + Reference.External().size() );
  for( const auto& [pPrefix, rBlock] :
    { std::pair( "Tarvo.Internal.", Reference.Internal() ), std::pair( "Tarvo.External.", Reference.External() ) } )
  {
    for( const auto& [rKey, rValue] : rBlock )
    {
      EXPECT_TRUE( Tags.count( pPrefix + rKey ) == 1 && IsText( rValue, Tags[pPrefix + rKey] ) ) << rKey << " " << Tags[pPrefix + rKey];
    }
  }
  EXPECT_EQ( Tags["Tarvo.External.Text"], "Bühne 1, \"links\"" );
}
