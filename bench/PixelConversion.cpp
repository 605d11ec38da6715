// The software converter against what others take for the same conversions of a 1080p frame, in turns within one run.
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "bench/Figures.h"
#include "bench/Measuring.h"

#include <boost/align/aligned_allocator.hpp>

#include <algorithm>
#include <array>
#include <cstring>
#include <functional>
#include <stdexcept>

#if defined( STAGECORE_BENCH_LIBYUV )
#include <libyuv.h>
#endif
#if defined( STAGECORE_BENCH_SWSCALE )
extern "C"
{
#include <libavutil/imgutils.h>
#include <libswscale/swscale.h>
}
#include <memory>
#endif
#if defined( STAGECORE_BENCH_OPENCV )
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#endif

namespace
{

using KVZ::IPixelFormat;

// Our time over theirs. Both sides move bytes as fast as the memory gives them where there is nothing to compute: those are as fast as one
// another within what disturbs them.
[[maybe_unused]] constexpr double AsFast = 1.0;
[[maybe_unused]] constexpr double AsFastAsMemory = 1.1;
[[maybe_unused]] constexpr double TwiceAsFast = 1 / 2.0;
[[maybe_unused]] constexpr double FiveTimesAsFast = 1 / 5.0;

constexpr int Width = 1920;
constexpr int Height = 1080;

using VFrame = std::vector<uint8_t, boost::alignment::aligned_allocator<uint8_t, 64>>;

size_t SizeOf( IPixelFormat::Enum i_Format ) { return static_cast<size_t>( KVZ::GetImageSize( i_Format, Width, Height ) ); }

// The source's and the target's bytes, the same for both sides
struct VFrames
{
  VFrame m_Source;
  VFrame m_Target;
};

struct VComparison
{
  IPixelFormat::Enum m_Source;
  IPixelFormat::Enum m_Target;
  const char* m_pOther;
  double m_Bound;
  std::function<void( VFrames& )> m_Convert;
};

// What theirs and ours read alike: smooth and noisy parts, every value.
VFrame MakeSource( IPixelFormat::Enum i_Format )
{
  VFrame Frame( SizeOf( i_Format ) + 64 );
  uint32_t Noise = 1;
  for( size_t Byte = 0; Byte < Frame.size(); ++Byte )
  {
    Noise = Noise * 1664525 + 1013904223;
    Frame[Byte] = static_cast<uint8_t>( Byte / 8 + ( Noise >> 30 ) );
  }
  return Frame;
}

template<class TFunction>
double TimeOf( const TFunction& i_rFunction, int i_Calls )
{
  const int64_t Begin = NowNanoseconds();
  for( int Call = 0; Call < i_Calls; ++Call )
  {
    i_rFunction();
  }
  return static_cast<double>( NowNanoseconds() - Begin ) / i_Calls;
}

void Convert( const VComparison& i_rComparison, VFrames& io_rFrames )
{
  CoreVideoUtils::VPixelFormatConverter Converter;
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = Width;
  Info.m_ImageHeight = Height;
  Info.m_PixelFormat = i_rComparison.m_Source;
  if( !Converter.Convert( Info, io_rFrames.m_Source.data(), io_rFrames.m_Source.size(), i_rComparison.m_Target, io_rFrames.m_Target.data(),
        SizeOf( i_rComparison.m_Target ) ) )
  {
    throw std::runtime_error( "The converter refused " + KVZ::ToName( i_rComparison.m_Source ) + "." );
  }
}

void Compare( const VComparison& i_rComparison, const VBenchOptions& i_rOptions, std::vector<VFigure>& o_rFigures )
{
  constexpr int Calls = 4;
  VFrames Frames = { MakeSource( i_rComparison.m_Source ), VFrame( SizeOf( i_rComparison.m_Target ) + 64 ) };
  const auto Ours = [&] { Convert( i_rComparison, Frames ); };
  const auto Theirs = [&] { i_rComparison.m_Convert( Frames ); };
  TimeOf( Ours, 1 );
  TimeOf( Theirs, 1 );
  std::vector<double> Times;
  std::vector<double> Ratios;
  for( int Round = 0; Round < ( i_rOptions.m_bQuick ? 15 : 101 ); ++Round )
  {
    Times.push_back( TimeOf( Ours, Calls ) );
    Ratios.push_back( Times.back() / TimeOf( Theirs, Calls ) );
  }
  const std::string Name = "pixels, " + KVZ::ToName( i_rComparison.m_Source ) + " to " + KVZ::ToName( i_rComparison.m_Target );
  o_rFigures.push_back( { Name, Median( std::move( Times ) ) / 1000.0, "us", {} } );
  o_rFigures.push_back( { Name + " over " + i_rComparison.m_pOther, Median( std::move( Ratios ) ), "x", i_rComparison.m_Bound } );
}

std::vector<VComparison> CopyComparisons()
{
  const auto Copy = []( VFrames& io_rFrames )
  { std::memcpy( io_rFrames.m_Target.data(), io_rFrames.m_Source.data(), SizeOf( IPixelFormat::EU8Y8V8Y8 ) ); };
  return { { IPixelFormat::EU8Y8V8Y8, IPixelFormat::EY8U8Y8V8, "memcpy", 1 / 0.6, Copy } };
}

#if defined( STAGECORE_BENCH_LIBYUV )
std::vector<VComparison> LibyuvComparisons()
{
  // Its names for byte orders are those of a little-endian word: ARGB has blue first, RGB24 too.
  const auto Call = []( auto i_pFunction, int i_SourceBytes, int i_TargetBytes )
  {
    return [=]( VFrames& io_rFrames )
    { i_pFunction( io_rFrames.m_Source.data(), Width * i_SourceBytes, io_rFrames.m_Target.data(), Width * i_TargetBytes, Width, Height ); };
  };
  return {
    { IPixelFormat::EU8Y8V8Y8, IPixelFormat::EB8G8R8u8, "libyuv", AsFast, Call( &libyuv::UYVYToARGB, 2, 4 ) },
    { IPixelFormat::EY8U8Y8V8, IPixelFormat::EB8G8R8u8, "libyuv", AsFast, Call( &libyuv::YUY2ToARGB, 2, 4 ) },
    { IPixelFormat::EB8G8R8u8, IPixelFormat::EU8Y8V8Y8, "libyuv", AsFast, Call( &libyuv::ARGBToUYVY, 4, 2 ) },
    { IPixelFormat::EB8G8R8, IPixelFormat::EB8G8R8u8, "libyuv", AsFastAsMemory, Call( &libyuv::RGB24ToARGB, 3, 4 ) },
    { IPixelFormat::EB8G8R8u8, IPixelFormat::EB8G8R8, "libyuv", AsFastAsMemory, Call( &libyuv::ARGBToRGB24, 4, 3 ) },
    { IPixelFormat::EU8Y8V8Y8, IPixelFormat::ELuminance8, "libyuv", AsFastAsMemory, Call( &libyuv::UYVYToY, 2, 1 ) },
  };
}
#endif

#if defined( STAGECORE_BENCH_SWSCALE )
std::function<void( VFrames& )> Scaler( AVPixelFormat i_Source, AVPixelFormat i_Target )
{
  const std::shared_ptr<SwsContext> pContext(
    sws_getContext( Width, Height, i_Source, Width, Height, i_Target, SWS_BICUBIC, nullptr, nullptr, nullptr ), &sws_freeContext );
  if( !pContext )
  {
    throw std::runtime_error( "libswscale refused a conversion." );
  }
  // Formats of more planes than one take as many bytes as ours or less, which the source's end has.
  return [=]( VFrames& io_rFrames )
  {
    std::array<uint8_t*, 4> SourcePlanes{};
    std::array<uint8_t*, 4> TargetPlanes{};
    std::array<int, 4> SourceStrides{};
    std::array<int, 4> TargetStrides{};
    io_rFrames.m_Source.resize( std::max<size_t>( io_rFrames.m_Source.size(), Width * Height * 4 + 64 ) );
    av_image_fill_arrays( SourcePlanes.data(), SourceStrides.data(), io_rFrames.m_Source.data(), i_Source, Width, Height, 1 );
    av_image_fill_arrays( TargetPlanes.data(), TargetStrides.data(), io_rFrames.m_Target.data(), i_Target, Width, Height, 1 );
    sws_scale( pContext.get(), SourcePlanes.data(), SourceStrides.data(), 0, Height, TargetPlanes.data(), TargetStrides.data() );
  };
}

std::vector<VComparison> ScalerComparisons()
{
  return {
    { IPixelFormat::EU8Y8V8Y8, IPixelFormat::ER8G8B8, "libswscale", FiveTimesAsFast, Scaler( AV_PIX_FMT_UYVY422, AV_PIX_FMT_RGB24 ) },
    { IPixelFormat::EY8U8Y8V8, IPixelFormat::EB8G8R8, "libswscale", FiveTimesAsFast, Scaler( AV_PIX_FMT_YUYV422, AV_PIX_FMT_BGR24 ) },
    { IPixelFormat::ER8G8B8, IPixelFormat::EU8Y8V8Y8, "libswscale", FiveTimesAsFast, Scaler( AV_PIX_FMT_RGB24, AV_PIX_FMT_UYVY422 ) },
    { IPixelFormat::ER8G8B8, IPixelFormat::EY8U8Y8V8, "libswscale", FiveTimesAsFast, Scaler( AV_PIX_FMT_RGB24, AV_PIX_FMT_YUYV422 ) },
    // It reads the same samples from planes, so its side has no unpacking to do.
    { IPixelFormat::EU10Y10V10Y10, IPixelFormat::ER8G8B8, "libswscale from planes", TwiceAsFast, Scaler( AV_PIX_FMT_YUV422P10LE, AV_PIX_FMT_RGB24 ) },
    { IPixelFormat::EU10Y10V10Y10, IPixelFormat::EB8G8R8u8, "libswscale from planes", TwiceAsFast,
      Scaler( AV_PIX_FMT_YUV422P10LE, AV_PIX_FMT_BGRA ) },
  };
}
#endif

#if defined( STAGECORE_BENCH_OPENCV )
std::vector<VComparison> OpenCVComparisons()
{
  cv::setNumThreads( 1 );
  const auto EdgeAware = []( VFrames& io_rFrames )
  {
    const cv::Mat Source( Height, Width, CV_8UC1, io_rFrames.m_Source.data() );
    cv::Mat Target( Height, Width, CV_8UC3, io_rFrames.m_Target.data() );
    cv::cvtColor( Source, Target, cv::COLOR_BayerBG2RGB_EA );
  };
  return { { IPixelFormat::EBayerRG8, IPixelFormat::ER8G8B8, "OpenCV, edge-aware", AsFast, EdgeAware } };
}
#endif

std::vector<VComparison> AllComparisons()
{
  std::vector<VComparison> All = CopyComparisons();
  const auto Add = [&]( std::vector<VComparison> i_More ) { All.insert( All.end(), i_More.begin(), i_More.end() ); };
  static_cast<void>( Add );
#if defined( STAGECORE_BENCH_LIBYUV )
  Add( LibyuvComparisons() );
#endif
#if defined( STAGECORE_BENCH_SWSCALE )
  Add( ScalerComparisons() );
#endif
#if defined( STAGECORE_BENCH_OPENCV )
  Add( OpenCVComparisons() );
#endif
  return All;
}

}

std::vector<VFigure> MeasurePixelConversion( const VBenchOptions& i_rOptions )
{
  std::vector<VFigure> Figures;
  for( const VComparison& rComparison : AllComparisons() )
  {
    Compare( rComparison, i_rOptions, Figures );
  }
  return Figures;
}
