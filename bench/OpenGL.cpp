// The OpenGL converter with frames of 1080p, and where its time goes: laying out, upload, drawing, reading back. Where it draws by the processor the
// figures say what that costs; those of a graphics card are its own. Without a usable OpenGL there are none.
#include "bench/Figures.h"

#if defined( STAGECORE_OPENGL )

#include "CoreVideoUtilsOpenGL/PixelFormatConverterOpenGL.h"
#include "bench/Measuring.h"

#include <array>
#include <stdexcept>

namespace
{

using CoreVideoUtilsOpenGL::EStep;
using CoreVideoUtilsOpenGL::EUse;
using CoreVideoUtilsOpenGL::VPixelFormatConverterOpenGL;
using KVZ::IPixelFormat;

constexpr std::array StepNames = { "laying out", "upload", "drawing", "reading back" };

struct VJob
{
  KVZ::VideoFrameInfo m_Info{};
  std::vector<uint8_t> m_Source;
  std::vector<uint8_t> m_Target;
};

VJob MakeJob( IPixelFormat::Enum i_Source )
{
  VJob Job;
  Job.m_Info.m_ImageWidth = 1920;
  Job.m_Info.m_ImageHeight = 1080;
  Job.m_Info.m_PixelFormat = i_Source;
  Job.m_Source.resize( KVZ::GetImageSize( i_Source, 1920, 1080 ) );
  Job.m_Target.resize( KVZ::GetImageSize( IPixelFormat::ER8G8B8, 1920, 1080 ) );
  for( size_t Byte = 0; Byte < Job.m_Source.size(); ++Byte )
  {
    Job.m_Source[Byte] = static_cast<uint8_t>( Byte / 8 );
  }
  return Job;
}

// Nanoseconds
double TimeOf( KVZ::IPixelFormatConverter& i_rConverter, VJob& io_rJob )
{
  const int64_t Begin = NowNanoseconds();
  if( !i_rConverter.Convert( io_rJob.m_Info, io_rJob.m_Source.data(), io_rJob.m_Source.size(), IPixelFormat::ER8G8B8, io_rJob.m_Target.data(),
        io_rJob.m_Target.size() ) )
  {
    throw std::runtime_error( "A converter refused " + KVZ::ToName( io_rJob.m_Info.m_PixelFormat ) + "." );
  }
  return static_cast<double>( NowNanoseconds() - Begin );
}

// Milliseconds of each step, medians. Empty where nothing is drawn.
std::vector<double> TimesOfSteps( VJob& io_rJob, int i_Rounds )
{
  std::array<std::vector<double>, StepNames.size()> Times;
  int64_t Last = 0;
  VPixelFormatConverterOpenGL Converter( { EUse::Always, ":",
    [&]( EStep i_Step )
    {
      const int64_t Now = NowNanoseconds();
      Times[static_cast<size_t>( i_Step )].push_back( static_cast<double>( Now - Last ) / 1e6 );
      Last = Now;
    } } );
  for( int Round = 0; Round < i_Rounds; ++Round )
  {
    Last = NowNanoseconds();
    TimeOf( Converter, io_rJob );
  }
  std::vector<double> Medians;
  for( const std::vector<double>& rTimes : Times )
  {
    if( !rTimes.empty() )
    {
      Medians.push_back( Median( rTimes ) );
    }
  }
  return Medians;
}

void Measure( IPixelFormat::Enum i_Source, int i_Rounds, std::vector<VFigure>& o_rFigures )
{
  VJob Job = MakeJob( i_Source );
  const std::vector<double> Steps = TimesOfSteps( Job, i_Rounds );
  if( Steps.empty() )
  {
    return;
  }
  VPixelFormatConverterOpenGL OpenGL( { EUse::Always } );
  CoreVideoUtils::VPixelFormatConverter Software;
  TimeOf( OpenGL, Job );
  TimeOf( Software, Job );
  std::vector<double> Times;
  std::vector<double> Ratios;
  for( int Round = 0; Round < i_Rounds; ++Round )
  {
    Times.push_back( TimeOf( OpenGL, Job ) );
    Ratios.push_back( Times.back() / TimeOf( Software, Job ) );
  }
  const std::string Name = "opengl, " + KVZ::ToName( i_Source ) + " to R8G8B8";
  o_rFigures.push_back( { Name + ", frames a second", 1e9 / Median( std::move( Times ) ), "", {} } );
  o_rFigures.push_back( { Name + " over software", Median( std::move( Ratios ) ), "x", {} } );
  for( size_t Step = 0; Step < Steps.size(); ++Step )
  {
    o_rFigures.push_back( { Name + ", " + StepNames[Step], Steps[Step], "ms", {} } );
  }
}

}

std::vector<VFigure> MeasureOpenGL( const VBenchOptions& i_rOptions )
{
  std::vector<VFigure> Figures;
  for( const IPixelFormat::Enum Source : { IPixelFormat::EBayerRG8, IPixelFormat::EU8Y8V8Y8, IPixelFormat::EU10Y10V10Y10 } )
  {
    Measure( Source, i_rOptions.m_bQuick ? 5 : 25, Figures );
  }
  return Figures;
}

#else

std::vector<VFigure> MeasureOpenGL( const VBenchOptions& ) { return {}; }

#endif
