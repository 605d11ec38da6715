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

// A value of each type. Times count in the base of MOV files, so that all containers keep the same.
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
  rAttributes.Set( "Saturation", std::string( "gives way" ) );
  return Settings;
}

VHeader OfImages( VHeader i_Header )
{
  i_Header.m_Payload = KVZ::IVideoPayload::EImagePNG;
  i_Header.m_AudioPayload = KVZ::IAudioPayload::ENone;
  return i_Header;
}

class Attributes : public testing::Test
{
protected:
  // The file that holds the attributes: beside images there is one of its own.
  std::string Write( const VContainerRow& i_rRow, const VHeader& i_rHeader ) const
  {
    const std::string Path = m_Folder.File( std::string( "movie." ) + i_rRow.m_pName );
    const auto pWriter = MakeWriter( i_rRow.m_Container );
    EXPECT_TRUE( pWriter->Open( Path ) && i_rHeader.WriteTo( *pWriter ) && pWriter->Close() );
    return i_rRow.m_Container == Images.m_Container ? m_Folder.File( "movie.tarvovideoattributes" ) : Path;
  }

  // Both blocks as the system's own container keeps them, the internal one first.
  VBytes ReferenceBlocks( const VHeader& i_rHeader ) const
  {
    constexpr std::ptrdiff_t FixedHeader = 48;
    const std::string Path = Write( Tvid, i_rHeader );
    const VBytes File = VRiffParser::ReadFile( Path );
    return { File.begin() + FixedHeader, File.begin() + static_cast<std::ptrdiff_t>( VTvidParser( Path ).RecordsStart() ) };
  }

  const VTemporaryFolder m_Folder;
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

struct VKeysRow
{
  VContainerRow m_Row;
  bool m_bTiming;   // and colour
  bool m_bTimecode;
};

// Whether there are keys for a timing that nobody has set and for a timecode that is none.
constexpr VKeysRow KeysOfNoUse[] = { { Tvid, false, false }, { Mov, true, true }, { MP4, true, true }, { Avi, false, true }, { Mkv, true, true },
  { Images, true, true } };

}

TEST_F( Attributes, OfMovAndMP4AreTheSameBytesInATimescaleOfTheirOwn )
{
  VHeader Header = Recording();
  Header.m_Timing = { 30000, 1001, -20020 };
  for( const VContainerRow& rRow : { Mov, MP4 } )
  {
    const auto File = VMovParser::OfFile( Write( rRow, Header ) );
    EXPECT_EQ( File.Body( File.Root().Child( "TMSL" ) ), ReferenceBlocks( Recording() ) ) << rRow.m_pName;
  }
}

TEST_F( Attributes, OfAviAreTheSameBytes )
{
  const VRiffParser File( VRiffParser::ReadFile( Write( Avi, Recording() ) ) );
  ASSERT_EQ( File.Riffs().back().m_Form, "TMSL" );
  EXPECT_EQ( File.Content( File.Riffs().back() ), ReferenceBlocks( Recording() ) );
}

TEST_F( Attributes, BesideImagesAreTheSameBytesOfTheFormatThatIsCompressed )
{
  VHeader Stored = Recording();
  Stored.m_Video.m_PixelFormat = KVZ::IPixelFormat::ER8G8B8;
  Stored.m_Audio = {};
  EXPECT_EQ( VRiffParser::ReadFile( Write( Images, OfImages( Recording() ) ) ), ReferenceBlocks( Stored ) );
}

TEST_F( Attributes, OfMatroskaAreTheSameValues )
{
  const VEbmlParser File( VRiffParser::ReadFile( Write( Mkv, Recording() ) ) );
  std::map<std::string, std::string> Tags = ReadTags( File );
  const VTvidParser Reference( Write( Tvid, Recording() ) );
  EXPECT_EQ( Tags.size(), Reference.Internal().size() + Reference.External().size() );
  for( const auto& [pPrefix, rBlock] :
    { std::pair( "Tarvo.Internal.", Reference.Internal() ), std::pair( "Tarvo.External.", Reference.External() ) } )
  {
    for( const auto& [rKey, rValue] : rBlock )
    {
      EXPECT_TRUE( Tags.count( pPrefix + rKey ) == 1 && IsText( rValue, Tags[pPrefix + rKey] ) ) << rKey << " " << Tags[pPrefix + rKey];
    }
  }
}

TEST_F( Attributes, OfNoUseAreLeftOutBySomeContainers )
{
  for( const VKeysRow& rKeys : KeysOfNoUse )
  {
    SCOPED_TRACE( rKeys.m_Row.m_pName );
    VHeader Header = MovieHeader( 4, 2 );
    Header.m_Timing = {};
    Header.m_Timecode = { KVZ::ITimecodeStandard::ETimecode25, 0, 0, 0, 25 };
    const bool bImages = rKeys.m_Row.m_Container == Images.m_Container;
    const VBytes File = VRiffParser::ReadFile( Write( rKeys.m_Row, bImages ? OfImages( Header ) : Header ) );
    const std::string Text( File.begin(), File.end() );
    EXPECT_EQ( Text.find( "TicksPerSecond" ) != std::string::npos, rKeys.m_bTiming );
    EXPECT_EQ( Text.find( "GammaCorrection" ) != std::string::npos, rKeys.m_bTiming );
    EXPECT_EQ( Text.find( "Timecode.UserBits" ) != std::string::npos, rKeys.m_bTimecode );
  }
}
