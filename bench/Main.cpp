// stagecore_bench: measures speed and memory, prints each figure beside its bound, and fails where one is missed.
#include "StageCoreRuntime/GlobalLog.h"
#include "bench/Figures.h"
#include "bench/Machine.h"

#include <CLI/CLI.hpp>
#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>

#include <algorithm>
#include <cstdio>
#include <exception>

namespace
{

enum EExitCode : int
{
  ExitMet = 0,
  ExitMissed = 1,
  ExitUsage = 2
};

struct VSubject
{
  const char* m_pName;
  std::vector<VFigure> ( *m_pMeasure )( const VBenchOptions& );
};

// Recording comes first: a child's peak memory begins with what its parent has at the fork.
constexpr VSubject Subjects[] = { { "record", &MeasureRecording }, { "framepath", &MeasureFramePath }, { "file", &MeasureFileWriting },
  { "pixels", &MeasurePixelConversion }, { "movies", &MeasureMovies }, { "compression", &MeasureImageCompression },
  { "images", &MeasureImageSequence }, { "flow", &MeasureFlow }, { "opengl", &MeasureOpenGL } };

// A folder of its own in the one that was asked for, removed with all in it.
class VScratchFolder
{
public:
  explicit VScratchFolder( const std::string& i_rParent )
    : m_Path( boost::filesystem::absolute( i_rParent.empty() ? boost::filesystem::temp_directory_path() : boost::filesystem::path( i_rParent ) ) /
        boost::filesystem::unique_path( "stagecore-bench-%%%%%%%%" ) )
  {
    boost::filesystem::create_directories( m_Path );
  }
  ~VScratchFolder()
  {
    boost::system::error_code Error;
    boost::filesystem::remove_all( m_Path, Error );
  }
  VScratchFolder( const VScratchFolder& ) = delete;
  VScratchFolder& operator=( const VScratchFolder& ) = delete;

  std::string Path() const { return m_Path.string(); }

private:
  const boost::filesystem::path m_Path;
};

void Print( const VFigure& i_rFigure )
{
  std::printf( "%-72s %10.3f %-4s", i_rFigure.m_Name.c_str(), i_rFigure.m_Value, i_rFigure.m_Unit.c_str() );
  if( i_rFigure.m_Bound )
  {
    std::printf( " %10.3f  %s", *i_rFigure.m_Bound, i_rFigure.IsMet() ? "met" : "MISSED" );
  }
  std::printf( "\n" );
  std::fflush( stdout );
}

int Run( VBenchOptions i_Options, const std::vector<std::string>& i_rNames )
{
  const VScratchFolder Folder( i_Options.m_Folder );
  i_Options.m_Folder = Folder.Path();
  std::printf( "%s\n%-72s %10s %-4s %10s\n", DescribeMachine( i_Options.m_Folder ).c_str(), "FIGURE", "VALUE", "", "BOUND" );
  bool bAllMet = true;
  for( const VSubject& rSubject : Subjects )
  {
    if( !i_rNames.empty() && std::count( i_rNames.begin(), i_rNames.end(), rSubject.m_pName ) == 0 )
    {
      continue;
    }
    for( const VFigure& rFigure : rSubject.m_pMeasure( i_Options ) )
    {
      Print( rFigure );
      bAllMet = bAllMet && rFigure.IsMet();
    }
  }
  return bAllMet ? ExitMet : ExitMissed;
}

}

int main( int i_Count, char** i_ppArguments )
{
  VBenchOptions Options;
  std::vector<std::string> Names;
  CLI::App App( "Measures speed and memory against their bounds. Run it on a machine that does nothing else.", "stagecore_bench" );
  App.add_flag( "--quick", Options.m_bQuick, "Fewer and shorter rounds; the figures scatter more" );
  App.add_option( "--folder", Options.m_Folder, "Where files are written and removed again (default: the system's temporary folder)" );
  App.add_option( "subject", Names, "What to measure: record, framepath, file, pixels, movies, compression, images, flow, opengl (default: all)" )
    ->check( CLI::IsMember( { "record", "framepath", "file", "pixels", "movies", "compression", "images", "flow", "opengl" } ) );
  try
  {
    App.parse( i_Count, i_ppArguments );
  }
  catch( const CLI::ParseError& rError )
  {
    return App.exit( rError ) == 0 ? ExitMet : ExitUsage;
  }
  KVZ::VLogOptions Log;
  Log.m_ConsoleLevel = KVZ::LogLevel::Warning;
  KVZ::ConfigureLog( Log );
  try
  {
    return Run( Options, Names );
  }
  catch( const std::exception& rError )
  {
    std::fprintf( stderr, "stagecore_bench: %s\n", rError.what() );
    return ExitMissed;
  }
}
