// What a settings file keeps, whatever happens to it.
#include "host/SettingsFile.h"

#include "Core/VideoInterface/Schemas.h"
#include "StageCoreDataStore/DataVerifyWriter.h"
#include "StageCoreDataStoreTypes/MaskGrid.h"
#include "host/DataStore.h"
#include "tests/support/FileSizeLimit.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/Threads.h"
#include "tests/support/WholeFile.h"

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <fstream>
#include <limits>

#include <sys/stat.h>
#include <unistd.h>

using KVZ::Variant;
using StageHost::VSettingsFile;
using VJson = nlohmann::json;
using VTexts = std::vector<std::string>;

namespace
{

using TestSupport::ReadFile;

class SettingsFile : public testing::Test
{
protected:
  void WriteFile( const std::string& i_rText ) { std::ofstream( m_Path, std::ios::binary ) << i_rText; }
  VJson ReadJson() const { return VJson::parse( ReadFile( m_Path ), nullptr, false ); }

  template<class T>
  void Put( const std::string& i_rKey, const T& i_rValue, uint32_t i_Flags = 0 )
  {
    VDataWriter Writer( m_Store );
    Writer.SetValueFlags( m_Device + i_rKey, i_Flags );
    Writer.SetValue( m_Device + i_rKey, Variant::Make( i_rValue ) );
  }
  bool Save( const VTexts& i_rKeys )
  {
    std::vector<VDataPath> Paths;
    for( const std::string& rKey : i_rKeys )
    {
      Paths.push_back( m_Device + rKey );
    }
    return m_File.Save( m_Store, Paths, m_Error );
  }
  bool SaveName( const std::string& i_rName )
  {
    Put( "Name", i_rName );
    return Save( { "Name" } );
  }
  VJson SavedName() const { return ReadJson()["settings"]["VideoInput.vi:0.Settings.Name"]["value"]; }
  // The values of the file in a store of a new run.
  VTexts Restore() { return m_File.Restore( m_Restored ); }
  std::string Text( const std::string& i_rKey ) { return VDataReader( m_Restored ).GetValue( m_Device + i_rKey ).ToText(); }

  const TestSupport::VTemporaryFolder m_Folder;
  const std::string m_Path = m_Folder.File( "new/settings.json" );
  const VDataPath m_Device{ "VideoInput", "vi:0", "Settings" };
  StageHost::VDataStore m_Store;
  StageHost::VDataStore m_Restored;
  VSettingsFile m_File{ m_Path };
  std::string m_Error;
};

}

// A proposal too: the device then has its own say about it.
TEST_F( SettingsFile, ValuesComeBackAsTheyWere )
{
  Put( "Ratio", 12.0 / 11.0 );
  Put( "Offset", std::numeric_limits<int64_t>::min() );
  Put( "Odd", std::numeric_limits<double>::infinity() );
  Put( "Name", std::string( "C1 \"left\"\n\xc3\xa9.*" ) );
  Put( "Enabled", false );
  Put( "Format", KVZ::IPixelFormat::EU10Y10V10Y10 );
  Put( "Number", std::string( "5" ) );
  Put( "Gain", 1, DataFlags::VerifyRequired );
  VDataVerifyWriter( m_Store ).SetProposedValue( m_Device + "Gain", Variant::Make( 2 ) );
  const VTexts Keys = { "Ratio", "Offset", "Odd", "Name", "Enabled", "Format", "Number", "Gain" };
  ASSERT_TRUE( Save( Keys ) ) << m_Error;

  // What is not the user's is never kept.
  Put( "Status", 1, DataFlags::ReadOnly );
  Put( "Password", std::string( "x" ), DataFlags::NotSerialized );
  ASSERT_TRUE( Save( { "Status", "Password" } ) ) << m_Error;
  EXPECT_EQ( ReadJson()["settings"].size(), Keys.size() );
  EXPECT_EQ( Restore(), VTexts() );
  const VDataVerifyReader Reader( m_Restored );
  for( const std::string& rKey : Keys )
  {
    EXPECT_EQ( Reader.GetValue( m_Device + rKey ), VDataReader( m_Store ).GetValue( m_Device + rKey ) ) << rKey;
    EXPECT_EQ( Reader.IsSettled( m_Device + rKey ), rKey != "Gain" ) << rKey;
  }
  Variant Proposed;
  EXPECT_TRUE( Reader.GetProposedValue( m_Device + "Gain", Proposed ) );
  EXPECT_EQ( Proposed, Variant::Make( 2 ) );
  EXPECT_EQ( ReadJson()["settings"]["VideoInput.vi:0.Settings.Format"]["value"], "U10Y10V10Y10" ) << "names, not numbers";
  EXPECT_EQ( ReadJson()["settings"]["VideoInput.vi:0.Settings.Enabled"]["value"], false );
}

TEST_F( SettingsFile, WhatTheFileCannotHoldIsRefusedAndTheFileStays )
{
  ASSERT_TRUE( SaveName( "A" ) );
  const std::string Before = ReadFile( m_Path );
  Put( "Mask", VMaskGrid() );
  EXPECT_FALSE( Save( { "Mask" } ) );
  EXPECT_NE( m_Error.find( "VideoInput.vi:0.Settings.Mask" ), std::string::npos ) << m_Error;
  EXPECT_FALSE( SaveName( "\xff" ) );
  EXPECT_NE( m_Error.find( "UTF-8" ), std::string::npos ) << m_Error;
  EXPECT_FALSE( VSettingsFile( "" ).Save( m_Store, { m_Device + "Name" }, m_Error ) );
  EXPECT_EQ( ReadFile( m_Path ), Before );
}

TEST_F( SettingsFile, WhatIsUnknownStaysInTheFile )
{
  ASSERT_TRUE( SaveName( "A" ) );
  Put( "Gain", 3 );
  VJson Document = VJson::parse( R"({ "note": [ 1, null ], "settings": {
    "VideoInput.vi:7.Settings.Lens": { "type": "Lens.Enum", "value": "Wide" },
    "VideoInput.vi:0.Settings.Name": { "type": "string", "value": "B", "who": "me" },
    "VideoInput.vi:0.Settings.Old": { "type": "uint32", "value": -1 },
    "VideoInput..vi:0.Settings.Name": { "type": "string", "value": "not the place of Name" },
    "Attributes.VideoInput.vi:0.Settings.Name.Max": { "type": "string", "value": "A" },
    "": 5 } })" );
  WriteFile( Document.dump() );
  EXPECT_EQ( Restore().size(), 5u );
  EXPECT_EQ( Text( "Name" ), "B" );
  EXPECT_EQ( VDataReader( m_Restored ).CountValues( VDataPath{ "Attributes" } ), 0u );
  EXPECT_FALSE( VDataReader( m_Restored ).Exists( m_Device + "Old" ) );

  ASSERT_TRUE( Save( { "Name", "Gain" } ) ) << m_Error;
  Document["version"] = 1;
  Document["settings"]["VideoInput.vi:0.Settings.Name"]["value"] = "A";
  Document["settings"]["VideoInput.vi:0.Settings.Gain"] = { { "type", "int32" }, { "value", 3 } };
  EXPECT_EQ( ReadJson(), Document );

  ASSERT_TRUE( m_File.Remove( { m_Device + "Name" }, m_Error ) ) << m_Error;
  Document["settings"].erase( "VideoInput.vi:0.Settings.Name" );
  EXPECT_EQ( ReadJson(), Document );
}

TEST_F( SettingsFile, ADamagedFileIsSetAsideOnce )
{
  ASSERT_TRUE( SaveName( "A" ) );
  const std::string Whole = ReadFile( m_Path );
  const VTexts Damaged = { "", Whole.substr( 0, Whole.size() / 2 ), "[]", R"({ "settings": 5 })", R"({ "version": "x" })", "\xff\xfe",
    std::string( 100000, '[' ), R"({ "note": 1e999 })" };
  for( size_t Index = 0; Index < Damaged.size(); ++Index )
  {
    SCOPED_TRACE( Damaged[Index].substr( 0, 20 ) );
    const std::string Aside = m_Path + ".damaged" + ( Index == 0 ? "" : std::to_string( Index + 1 ) );
    WriteFile( Damaged[Index] );
    EXPECT_FALSE( Save( { "Name" } ) ) << "nothing is written over it";
    EXPECT_NE( m_Error.find( m_Path + "\" is damaged" ), std::string::npos ) << m_Error;
    const VTexts Messages = Restore();
    ASSERT_EQ( Messages.size(), 1u );
    EXPECT_NE( Messages[0].find( m_Path + "\" is damaged" ), std::string::npos ) << Messages[0];
    EXPECT_NE( Messages[0].find( Aside ), std::string::npos ) << Messages[0];
    EXPECT_EQ( Messages[0].find( "exception" ), std::string::npos ) << "words for people: " << Messages[0];
    EXPECT_EQ( ReadFile( Aside ), Damaged[Index] );
    EXPECT_EQ( Restore(), VTexts() ) << "a file that is not there holds nothing";
    EXPECT_TRUE( Save( { "Name" } ) ) << m_Error;
  }
}

TEST_F( SettingsFile, AFileOfALaterVersionIsLeftAlone )
{
  ASSERT_TRUE( SaveName( "A" ) );
  for( const std::string Version : { "2", "18446744073709551615" } )
  {
    const std::string Later = R"({ "settings": {}, "version": )" + Version + "}";
    WriteFile( Later );
    const VTexts Messages = Restore();
    ASSERT_EQ( Messages.size(), 1u );
    EXPECT_NE( Messages[0].find( "version " + Version ), std::string::npos ) << Messages[0];
    EXPECT_FALSE( Save( { "Name" } ) );
    EXPECT_EQ( ReadFile( m_Path ), Later );
  }
}

// A device, a folder, a link that leads to nothing plain: neither read nor replaced.
TEST_F( SettingsFile, OnlyAPlainFileIsASettingsFile )
{
  VSettingsFile Device( "/dev/null" );
  EXPECT_EQ( Device.Restore( m_Restored ).size(), 1u );
  EXPECT_FALSE( Device.Save( m_Store, {}, m_Error ) );
  EXPECT_TRUE( boost::filesystem::status( "/dev/null" ).type() == boost::filesystem::character_file );
  EXPECT_FALSE( boost::filesystem::exists( "/dev/null.lock" ) );
  VSettingsFile Folder( m_Folder.File( "" ) );
  EXPECT_EQ( Folder.Restore( m_Restored ).size(), 1u );
}

TEST_F( SettingsFile, ALinkStaysALink )
{
  ASSERT_TRUE( SaveName( "A" ) );
  const std::string Link = m_Folder.File( "link.json" );
  boost::filesystem::create_symlink( "new/settings.json", Link );
  boost::filesystem::permissions( m_Path, boost::filesystem::owner_read | boost::filesystem::owner_write );
  const bool bGivenAway = chown( m_Path.c_str(), 65534, 65534 ) == 0;   // by the superuser alone
  Put( "Name", std::string( "B" ) );
  ASSERT_TRUE( VSettingsFile( Link ).Save( m_Store, { m_Device + "Name" }, m_Error ) ) << m_Error;
  EXPECT_TRUE( boost::filesystem::is_symlink( Link ) );
  EXPECT_EQ( SavedName(), "B" );
  struct stat Status = {};
  ASSERT_EQ( stat( m_Path.c_str(), &Status ), 0 );
  EXPECT_EQ( Status.st_mode & 07777, 0600u );
  EXPECT_EQ( Status.st_uid, bGivenAway ? 65534 : getuid() ) << "its owner must be able to write it again";

  // Also a link to a file that is yet to come.
  boost::filesystem::remove( m_Path );
  ASSERT_TRUE( VSettingsFile( Link ).Save( m_Store, { m_Device + "Name" }, m_Error ) ) << m_Error;
  EXPECT_TRUE( boost::filesystem::is_symlink( Link ) );
  EXPECT_EQ( SavedName(), "B" );
  // One in the place of the new file leads nowhere.
  const std::string Other = m_Folder.File( "other" );
  std::ofstream( Other ) << "mine";
  boost::filesystem::create_symlink( Other, m_Path + ".new" );
  ASSERT_TRUE( SaveName( "C" ) ) << m_Error;
  EXPECT_EQ( ReadFile( Other ), "mine" );
  const std::string Circle = m_Folder.File( "circle.json" );
  boost::filesystem::create_symlink( Circle, Circle );
  EXPECT_FALSE( VSettingsFile( Circle ).Save( m_Store, { m_Device + "Name" }, m_Error ) );
}

TEST_F( SettingsFile, AFullDiskLeavesTheOldFile )
{
  ASSERT_TRUE( SaveName( "A" ) );
  const std::string Before = ReadFile( m_Path );
  {
    const TestSupport::VFileSizeLimit Limit( 1000 );
    EXPECT_FALSE( SaveName( std::string( 5000, 'x' ) ) );
  }
  EXPECT_NE( m_Error.find( m_Path + "\" cannot be written: File too large" ), std::string::npos ) << m_Error;
  EXPECT_EQ( ReadFile( m_Path ), Before );
  EXPECT_FALSE( boost::filesystem::exists( m_Path + ".new" ) );
  EXPECT_TRUE( Save( { "Name" } ) ) << m_Error;
}

// A lock belongs to the open file, so two threads exclude each other as two processes do.
TEST_F( SettingsFile, WritersLoseNothingOfEachOther )
{
  constexpr int SavesEach = 25;
  const auto SaveMany = [this]( int i_First )
  {
    StageHost::VDataStore Store;
    VSettingsFile File( m_Path );
    for( int Number = i_First; Number < i_First + SavesEach; ++Number )
    {
      const VDataPath Path = m_Device + ( "Key" + std::to_string( Number ) );
      std::string Error;
      VDataWriter( Store ).SetValue( Path, Variant::Make( Number ) );
      EXPECT_TRUE( File.Save( Store, { Path }, Error ) ) << Error;
      EXPECT_TRUE( File.Remove( { m_Device + "Common" }, Error ) ) << Error;
    }
  };
  TestSupport::RunOnThreads( 2, [&]( uint32_t i_Thread ) { SaveMany( static_cast<int>( i_Thread ) * SavesEach ); } );
  EXPECT_EQ( Restore(), VTexts() );
  for( int Number = 0; Number < 2 * SavesEach; ++Number )
  {
    EXPECT_EQ( Text( "Key" + std::to_string( Number ) ), std::to_string( Number ) );
  }
}
