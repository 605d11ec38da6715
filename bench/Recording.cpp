// The whole program: `stagehost record` of a virtual 1080p59.94 card, against one copy and one write of each frame.
#include "bench/Figures.h"
#include "bench/Measuring.h"
#include "bench/PlainFile.h"
#include "tests/support/ProgramRun.h"

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>
#include <boost/thread/thread.hpp>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <atomic>
#include <cstring>
#include <stdexcept>

namespace
{

constexpr const char* Card = "decklink:standard=HD_1920_1080P_5994,pattern=counter";
constexpr uint64_t MemoryMiB[] = { 256, 1024 };
constexpr double MemoryAllowanceMiB = 96.0;
constexpr uint64_t ShortFrames = 60;
constexpr int64_t PeriodNanoseconds = 16683333;

struct VCost
{
  double m_ProcessorSeconds = 0.0;
  double m_PeakMiB = 0.0;
  double m_BytesPerFrame = 0.0;   // in the file
};

std::string Program() { return ( boost::filesystem::read_symlink( "/proc/self/exe" ).parent_path() / "stagehost" ).string(); }

VCost Record( const std::string& i_rFolder, uint64_t i_Frames, uint64_t i_MemoryMiB )
{
  const boost::filesystem::path Folder = boost::filesystem::path( i_rFolder ) / "recording";
  TestSupport::VRunOptions Options;
  Options.m_Seconds = 120.0;
  const auto Result = TestSupport::RunProgram( { Program(), "record", "--settings", "none", "--card", Card, "--frames", std::to_string( i_Frames ),
                                                 "--memory", std::to_string( i_MemoryMiB ), "--output", Folder.string(), "--json" },
    Options );
  boost::filesystem::remove_all( Folder );
  if( Result.m_ExitCode != 0 )
  {
    throw std::runtime_error( "stagehost ended with " + std::to_string( Result.m_ExitCode ) + ":\n" + Result.m_Output + Result.m_Error );
  }
  const nlohmann::json Report = nlohmann::json::parse( Result.m_Output ).at( 0 );
  if( Report.at( "frames_written" ) != i_Frames )
  {
    throw std::runtime_error( "stagehost did not write all frames:\n" + Result.m_Output );
  }
  return { Result.m_ProcessorSeconds, static_cast<double>( Result.m_PeakResidentKiB ) / 1024.0,
    Report.at( "bytes" ).get<double>() / static_cast<double>( i_Frames ) };
}

// Copies frames, writes them to a file and does nothing else, on a thread of its own and at the card's pace, from construction to Stop. Fresh
// pages for a file cost several times more on one minute than on the next, on a machine that is itself virtual and gives unused memory back:
// only what runs beside the program meets the same prices.
class VLeastWork
{
public:
  VLeastWork( const std::string& i_rFolder, size_t i_FrameBytes )
    : m_FrameBytes( i_FrameBytes ),
      m_From( Sources * i_FrameBytes, 0x5A ),
      m_To( Copies * i_FrameBytes, 0xA5 ),
      m_File( i_rFolder + "/plain_bench.raw" ),
      m_Thread( [this] { Run(); } )
  {
  }
  ~VLeastWork() { Stop(); }
  VLeastWork( const VLeastWork& ) = delete;
  VLeastWork& operator=( const VLeastWork& ) = delete;

  // Returns processor seconds a frame.
  double Stop()
  {
    m_bStop = true;
    if( m_Thread.joinable() )
    {
      m_Thread.join();
    }
    return m_Seconds / static_cast<double>( m_Frames );
  }

private:
  // Few, because the peak memory of a child begins with what this process has when it starts one.
  static constexpr size_t Sources = 8;
  static constexpr size_t Copies = 24;

  void Run()
  {
    const int64_t Begin = NowNanoseconds();
    const double Before = ThreadSeconds();
    do {
      uint8_t* pCopy = m_To.data() + m_Frames % Copies * m_FrameBytes;
      std::memcpy( pCopy, m_From.data() + m_Frames % Sources * m_FrameBytes, m_FrameBytes );
      m_File.Write( pCopy, m_FrameBytes );
      ++m_Frames;
      WaitUntil( Begin + static_cast<int64_t>( m_Frames ) * PeriodNanoseconds );
    } while( !m_bStop );
    m_Seconds = ThreadSeconds() - Before;
  }

  const size_t m_FrameBytes;
  std::vector<uint8_t> m_From;
  std::vector<uint8_t> m_To;
  VPlainFile m_File;
  std::atomic<bool> m_bStop{ false };
  uint64_t m_Frames = 0;
  double m_Seconds = 0.0;
  boost::thread m_Thread;
};

struct VComparison
{
  double m_FrameSeconds = 0.0;   // of the program
  double m_LeastSeconds = 0.0;   // of one copy and one write
  VCost m_Long{};
};

// The difference of a long and a short recording leaves the start of the program out.
VComparison Compare( const std::string& i_rFolder, uint64_t i_MemoryMiB, uint64_t i_Frames )
{
  const VCost Short = Record( i_rFolder, ShortFrames, i_MemoryMiB );
  VLeastWork Least( i_rFolder, static_cast<size_t>( Short.m_BytesPerFrame ) );
  VComparison Result;
  Result.m_Long = Record( i_rFolder, i_Frames, i_MemoryMiB );
  Result.m_LeastSeconds = Least.Stop();
  Result.m_FrameSeconds = ( Result.m_Long.m_ProcessorSeconds - Short.m_ProcessorSeconds ) / static_cast<double>( i_Frames - ShortFrames );
  return Result;
}

std::vector<VFigure> MeasureWithMemory( const VBenchOptions& i_rOptions, uint64_t i_MemoryMiB )
{
  const uint64_t Frames = i_rOptions.m_bQuick ? 240 : 600;
  std::vector<double> Ratios;
  std::vector<double> Milliseconds;
  std::vector<double> LeastMilliseconds;
  std::vector<double> InAll;
  double PeakMiB = 0.0;
  for( int Round = 0; Round < ( i_rOptions.m_bQuick ? 1 : 3 ); ++Round )
  {
    const VComparison Result = Compare( i_rOptions.m_Folder, i_MemoryMiB, Frames );
    Ratios.push_back( Result.m_FrameSeconds / Result.m_LeastSeconds );
    Milliseconds.push_back( Result.m_FrameSeconds * 1000.0 );
    LeastMilliseconds.push_back( Result.m_LeastSeconds * 1000.0 );
    InAll.push_back( Result.m_Long.m_ProcessorSeconds );
    PeakMiB = std::max( PeakMiB, Result.m_Long.m_PeakMiB );
  }
  const std::string With = ", --memory " + std::to_string( i_MemoryMiB );
  return {
    { "record, processor time a frame over one copy and one write" + With, Median( Ratios ), "x", 2.5 },
    { "record, processor time a frame" + With, Median( Milliseconds ), "ms", {} },
    { "record, one copy and one write of a frame" + With, Median( LeastMilliseconds ), "ms", {} },
    { "record, processor time of " + std::to_string( Frames ) + " frames in all" + With, Median( InAll ), "s", {} },
    { "record, peak resident memory" + With, PeakMiB, "MiB", static_cast<double>( i_MemoryMiB ) + MemoryAllowanceMiB },
  };
}

}

std::vector<VFigure> MeasureRecording( const VBenchOptions& i_rOptions )
{
  std::vector<VFigure> Figures;
  for( const uint64_t Memory : MemoryMiB )
  {
    for( VFigure& rFigure : MeasureWithMemory( i_rOptions, Memory ) )
    {
      Figures.push_back( std::move( rFigure ) );
    }
  }
  return Figures;
}
