#include "StageCoreRuntime/GlobalLog.h"
#include "StageCoreRuntime/LogRepeats.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/Threads.h"
#include "tests/support/WholeFile.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <iterator>

namespace
{
using TestSupport::VLogCapture;

template<class... TArgs>
std::string Format( const char* i_pFormat, const TArgs&... i_rArgs )
{
  const std::vector<KVZ::VLogArgument> Arguments{ KVZ::VLogArgument( i_rArgs )... };
  return KVZ::FormatLogMessage( i_pFormat, Arguments.data(), Arguments.size() );
}

enum class EColour : uint8_t
{
  Red = 7
};

TEST( LogFormat, TakesPlaceholdersAndPrintfFormsAndEveryTypeOfArgument )
{
  EXPECT_EQ( Format( "%1% Buffer:Session %2% of %1%", std::string( "vi:0" ), 3u ), "vi:0 Buffer:Session 3 of vi:0" );
  EXPECT_EQ( Format( "Client '%s' wrote %.2f seconds, %d frames, %i more", "a", 1.005e1, 250, -3 ),
    "Client 'a' wrote 10.05 seconds, 250 frames, -3 more" );
  EXPECT_EQ( Format( "%u %lld %llu %zu", 7u, -5ll, ~0ull, sizeof( int ) ), "7 -5 18446744073709551615 4" );
  EXPECT_EQ( Format( "Failed (= 0x%x), 0x%08X", int32_t( -2147467259 ), 0xabcu ), "Failed (= 0x80004005), 0x00000ABC" );
  EXPECT_EQ( Format( "100%% of %1%", std::string_view( "it" ) ), "100% of it" );
  EXPECT_EQ( Format( "Nothing to fill in." ), "Nothing to fill in." );
  EXPECT_EQ( Format( "%1%:%2%:%3%", uint8_t( 9 ), int8_t( -1 ), 'A' ), "9:-1:65" );
  EXPECT_EQ( Format( "%1% %2% %3%", true, EColour::Red, 29.97f ), "1 7 29.97" );
  EXPECT_EQ( Format( "%1% %2%", std::numeric_limits<int64_t>::min(), std::numeric_limits<uint64_t>::max() ),
    "-9223372036854775808 18446744073709551615" );
  EXPECT_EQ( Format( "[%1%]", static_cast<const char*>( nullptr ) ), "[(null)]" );
  // What an argument holds is never a format.
  EXPECT_EQ( Format( "%s", "50%1% %s" ), "50%1% %s" );
}

TEST( LogFormat, ReplacesATextThatCannotBeFormatted )
{
  EXPECT_EQ( Format( "Too few %1% %2%", 1 ), "Cannot Format Log Message \"Too few %1% %2%\"" );
  EXPECT_EQ( Format( "Too many %s", 1, 2 ), "Cannot Format Log Message \"Too many %s\"" );
  EXPECT_EQ( Format( "No argument %d" ), "Cannot Format Log Message \"No argument %d\"" );
  EXPECT_EQ( Format( "Mixed %1% %s", 1, 2 ), "Cannot Format Log Message \"Mixed %1% %s\"" );
  EXPECT_EQ( Format( "Stray %", 1 ), "Cannot Format Log Message \"Stray %\"" );
}

TEST( Log, EvaluatesItsArgumentsOnlyIfTheLevelIsAllowed )
{
  int Evaluated = 0;
  const auto Log = [&Evaluated]( int i_Level ) { KVZ_LOG( "GlobalLogTest.Level", i_Level, "Number %1%", ++Evaluated ); };
  Log( 5 );
  EXPECT_EQ( Evaluated, 0 );
  {
    const VLogCapture Capture( "GlobalLogTest.Level", 5 );
    const VLogCapture Other( "GlobalLogTest.Other", 6 );
    Log( 5 );
    Log( 6 );
    EXPECT_EQ( Capture.Texts(), ( std::vector<std::string>{ "Number 1" } ) );
    EXPECT_TRUE( Other.Texts().empty() );
  }
  Log( 5 );
  EXPECT_EQ( Evaluated, 1 );
}

TEST( Log, CarriesCategoryLevelAndPosition )
{
  const VLogCapture Capture;
  const KVZ::VLogCategory& rCategory = KVZ::LogCategory( std::string( "Hal." ) + "Card 1" );
  KVZ_LOG( rCategory, 6, "By object" );
  const int Line = __LINE__ - 1;
  for( const std::string Name : { "Hal.Card 1", "Hal.Card 2" } )
  {
    KVZ_LOG( Name, 5, "By %s", "name" );
  }
  KVZ_LOG_ERROR( "Hal.Card 3", "By literal" );
  const auto Lines = Capture.Lines();
  ASSERT_EQ( Lines.size(), 4u );
  EXPECT_EQ( Lines[0].m_Category, "Hal.Card 1" );
  EXPECT_EQ( Lines[0].m_Level, 6 );
  EXPECT_EQ( Lines[0].m_File, __FILE__ );
  EXPECT_EQ( Lines[0].m_Line, Line );
  EXPECT_EQ( Lines[1].m_Category, "Hal.Card 1" );
  EXPECT_EQ( Lines[2].m_Category, "Hal.Card 2" );
  EXPECT_EQ( Lines[2].m_Text, "By name" );
  EXPECT_EQ( Lines[3].m_Level, 2 );
}

class LogFile : public testing::Test
{
protected:
  ~LogFile() override { KVZ::ConfigureLog( {} ); }

  std::string Content() const { return TestSupport::ReadFile( m_Folder.File( "host.log" ) ); }

  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_F( LogFile, HoldsWhatItsLevelsAllowWithRepeatsFolded )
{
  ASSERT_TRUE( KVZ::ConfigureLog( { .m_ConsoleLevel = 0,
    .m_FilePath = m_Folder.File( "host.log" ),
    .m_FileLevel = 3,
    .m_CategoryLevels = { { "GlobalLogTest.Detailed", 6 }, { "GlobalLogTest.Silent", 0 } } } ) );
  testing::internal::CaptureStderr();
  for( int Repeat = 0; Repeat < 4; ++Repeat )
  {
    KVZ_LOG( "GlobalLogTest.Plain", 3, "a plain warning" );
  }
  KVZ_LOG( "GlobalLogTest.Plain", 5, "a plain information" );
  KVZ_LOG( "GlobalLogTest.Detailed", 6, "a wanted detail" );
  KVZ_LOG( "GlobalLogTest.Silent", 2, "an unwanted error" );
  const std::string Console = testing::internal::GetCapturedStderr();
  KVZ::ConfigureLog( {} );
  const std::string Found = Content();
  EXPECT_EQ( std::count( Found.begin(), Found.end(), '\n' ), 3 ) << Found;
  EXPECT_NE( Found.find( "[GlobalLogTest.Plain:warning] a plain warning (GlobalLogTest.cpp:" ), std::string::npos ) << Found;
  EXPECT_NE( Found.find( "[GlobalLogTest.Plain:warning] a plain warning (repeated 3 times) (GlobalLogTest.cpp:" ), std::string::npos ) << Found;
  EXPECT_NE( Found.find( "a wanted detail" ), std::string::npos ) << Found;
  EXPECT_EQ( Console.find( "a plain warning" ), std::string::npos );
  EXPECT_NE( Console.find( "a wanted detail" ), std::string::npos ) << Console;
}

TEST_F( LogFile, ThatCannotBeOpenedIsReportedAndTheConsoleGoesOn )
{
  const VLogCapture Capture( "GlobalLog" );
  std::ofstream( m_Folder.File( "occupied" ) ) << "a file, not a folder";
  testing::internal::CaptureStderr();
  EXPECT_FALSE( KVZ::ConfigureLog( { .m_FilePath = m_Folder.File( "occupied/host.log" ) } ) );
  KVZ_LOG( "GlobalLogTest.Plain", 2, "still here" );
  EXPECT_NE( testing::internal::GetCapturedStderr().find( "still here" ), std::string::npos );
  EXPECT_EQ( Capture.Texts().size(), 1u );
}

TEST( LogRepeats, CountUntilAnotherLineComesOrTheirTimeIsOver )
{
  double Now = 100.0;
  std::vector<std::string> Lines;
  KVZ::Detail::VLogRepeats Repeats( [&Lines]( const KVZ::VLogRecord& i_rRecord )
    { Lines.push_back( std::string( i_rRecord.m_Category ) + std::to_string( i_rRecord.m_Level ) + ' ' + std::string( i_rRecord.m_Text ) ); },
    [&Now] { return Now; } );
  const auto Write = [&Repeats]( const char* i_pCategory, int i_Level, const char* i_pText ) {
    Repeats.Write( { i_pCategory, i_Level, i_pText, "f.cpp", 1 } );
  };
  const auto Take = [&Lines] { return std::exchange( Lines, {} ); };
  using VLines = std::vector<std::string>;
  for( const char* pCategory : { "A", "A", "A", "B" } )
  {
    Write( pCategory, 2, "x" );
  }
  Write( "B", 3, "x" );
  EXPECT_EQ( Take(), ( VLines{ "A2 x", "A2 x (repeated 2 times)", "B2 x", "B3 x" } ) );
  for( int Second = 0; Second < 12; ++Second )
  {
    Write( "A", 2, "y" );
    Now += 1.0;
  }
  EXPECT_EQ( Take(), ( VLines{ "A2 y", "A2 y (repeated 4 times)", "A2 y", "A2 y (repeated 4 times)", "A2 y" } ) );
  Write( "A", 2, "z" );
  EXPECT_EQ( Take(), ( VLines{ "A2 y (repeated 1 times)", "A2 z" } ) );
}

TEST( Log, ObserverMayLogAndRemoveItself )
{
  const VLogCapture Capture( "GlobalLogTest.Observer" );
  uint64_t Id = 0;
  const auto Observe = [&Id]( const KVZ::VLogRecord& )
  {
    KVZ::RemoveLogObserver( Id );
    KVZ_LOG( "GlobalLogTest.Observer", 6, "From inside" );
  };
  Id = KVZ::AddLogObserver( { .m_Function = Observe, .m_Category = "GlobalLogTest.Observer" } );
  KVZ_LOG( "GlobalLogTest.Observer", 6, "First" );
  KVZ_LOG( "GlobalLogTest.Observer", 6, "Second" );
  EXPECT_EQ( Capture.Count( "From inside" ), 1u );
  EXPECT_EQ( Capture.Texts().size(), 3u );
}

TEST( Log, StandsSeveralThreadsWhileItIsReconfigured )
{
  constexpr int Messages = 500;
  const VLogCapture Capture( "GlobalLogTest.Threads" );
  const auto Reconfigure = []
  {
    for( int Round = 0; Round < 50; ++Round )
    {
      const VLogCapture Passing( "GlobalLogTest.New7" );
      KVZ::ConfigureLog( { .m_CategoryLevels = { { "GlobalLogTest.New8", Round % 3 } } } );
    }
  };
  const auto Write = []
  {
    for( int Message = 0; Message < Messages; ++Message )
    {
      KVZ_LOG( "GlobalLogTest.Threads", 6, "%1%", Message );
      KVZ_LOG( KVZ::LogCategory( "GlobalLogTest.New" + std::to_string( Message ) ), 6, "%1%", Message );
    }
  };
  TestSupport::RunOnThreads( 3, [&]( uint32_t i_Thread ) { i_Thread == 0 ? Reconfigure() : Write(); } );
  KVZ::ConfigureLog( {} );
  EXPECT_EQ( Capture.Texts().size(), 2u * Messages );
}
}
