// The writers of other programs' containers: against a plain loop of write calls and against FFmpeg's muxer of the same container, with the
// same frames from the same memory to the same folder. And what a million frames cost: time to close, and memory for the tables.
#include "FileIO/MkvIO/MkvWriter.h"
#include "FileIO/MovIO/MovWriter.h"
#include "FileIO/RapidAVI/Writer.h"
#include "bench/FFmpegMuxer.h"
#include "bench/Figures.h"
#include "bench/Measuring.h"
#include "bench/PlainFile.h"
#include "tests/support/SparseFile.h"

#include <boost/filesystem/operations.hpp>

#include <algorithm>
#include <array>
#include <stdexcept>

namespace
{

using KVZ::IVideoContainer;

struct VMovieCase
{
  const char* m_pName;
  IVideoContainer::Enum m_Container;
  const char* m_pMuxer;   // FFmpeg's. The one of MP4 refuses uncompressed video, but is the same code as that of MOV
  const char* m_pTag;
  double m_PlainLoopBound;
};

constexpr std::array Cases = {
  VMovieCase{ "MOV", IVideoContainer::EMOV, "mov", "", 1.1 },
  VMovieCase{ "MP4", IVideoContainer::EMP4, "mov", "", 1.1 },
  VMovieCase{ "MKV", IVideoContainer::EMKV, "matroska", "UYVY", 1.3 },
  VMovieCase{ "AVI", IVideoContainer::EAVI, "avi", "UYVY", 1.1 },
};

constexpr uint32_t Width = 1920;
constexpr uint32_t Height = 1080;
// A cache holds none of them by the time it is written again.
constexpr size_t DifferentImages = 24;
constexpr uint64_t ManyFrames = 1000000;

std::unique_ptr<KVZ::IVideoWriter> MakeWriter( IVideoContainer::Enum i_Container, const WriterSupport::VStreamMaker& i_rStreamMaker )
{
  switch( i_Container )
  {
    case IVideoContainer::EMKV: return std::make_unique<MkvIO::VMkvWriter>( nullptr, i_rStreamMaker );
    case IVideoContainer::EAVI: return std::make_unique<RapidAVI::VRapidAVIWriter>( nullptr, i_rStreamMaker );
    default: return std::make_unique<MovIO::VMovWriter>( i_Container, nullptr, i_rStreamMaker );
  }
}

void Require( bool i_bDone, const VMovieCase& i_rCase, const char* i_pWhat )
{
  if( !i_bDone )
  {
    throw std::runtime_error( std::string( "The writer of " ) + i_rCase.m_pName + " cannot " + i_pWhat + "." );
  }
}

KVZ::VideoFrameInfo MakeVideoInfo( uint32_t i_Width, uint32_t i_Height )
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = i_Width;
  Info.m_ImageHeight = i_Height;
  Info.m_PixelFormat = KVZ::IPixelFormat::EU8Y8V8Y8;
  Info.m_PixelAspectRatio = 1.0;
  Info.m_InterlacedFormat = KVZ::IInterlacedFormat::ENotInterlaced;
  return Info;
}

void WriteHeader( KVZ::IVideoWriter& io_rWriter, const VMovieCase& i_rCase, const std::string& i_rPath, const KVZ::VFrameSet& i_rFrame )
{
  constexpr KVZ::VTimingRecord Timing{ 135000000, 5400000, 0 };
  const auto AudioPayload = i_rFrame.m_Audio.empty() ? KVZ::IAudioPayload::ENone : KVZ::IAudioPayload::EUncompressed;
  Require( io_rWriter.Open( i_rPath ) &&
      io_rWriter.WriteHeader( i_rFrame.m_VideoInfo, i_rFrame.m_AudioInfo, Timing, {}, {}, {}, KVZ::IVideoPayload::EUncompressed, AudioPayload ),
    i_rCase, "write a header" );
}

// The same images for all, and one way to write them each. Processor seconds, up to the closed file, which is removed after that.
class VMovieComparison
{
public:
  VMovieComparison( const std::string& i_rFolder, size_t i_Frames ) : m_Folder( i_rFolder ), m_Frames( i_Frames )
  {
    for( size_t Image = 0; Image < DifferentImages; ++Image )
    {
      auto pImage = std::make_shared<KVZ::IStandardBuffer>( size_t{ Width } * Height * 2 );
      std::fill_n( pImage->Data(), pImage->Size(), static_cast<uint8_t>( Image + 1 ) );
      m_Images.push_back( std::move( pImage ) );
    }
  }

  double RunPlainLoop() const
  {
    VPlainFile File( m_Folder + "/plain_bench.raw" );
    const double Before = ProcessorSeconds();
    for( size_t Frame = 0; Frame < m_Frames; ++Frame )
    {
      File.Write( Image( Frame )->Data(), Image( Frame )->Size() );
    }
    File.Close();
    return ProcessorSeconds() - Before;
  }

  double RunWriter( const VMovieCase& i_rCase ) const
  {
    const std::string Path = m_Folder + "/movie_bench";
    const double Before = ProcessorSeconds();
    const std::unique_ptr<KVZ::IVideoWriter> pWriter = MakeWriter( i_rCase.m_Container, WriterSupport::MakeFile );
    KVZ::VFrameSet Frame{ nullptr, MakeVideoInfo( Width, Height ), {}, {} };
    WriteHeader( *pWriter, i_rCase, Path, Frame );
    for( size_t Number = 0; Number < m_Frames; ++Number )
    {
      Frame.m_pVideo = Image( Number );
      Require( pWriter->WriteFrame( Frame, Number ), i_rCase, "write a frame" );
    }
    Require( pWriter->Close(), i_rCase, "close its file" );
    return SecondsSince( Before, Path );
  }

  double RunFFmpeg( const VMovieCase& i_rCase ) const
  {
    const std::string Path = m_Folder + "/ffmpeg_bench";
    const double Before = ProcessorSeconds();
    VFFmpegMuxer Muxer( Path, { i_rCase.m_pMuxer, i_rCase.m_pTag, Width, Height } );
    for( size_t Frame = 0; Frame < m_Frames; ++Frame )
    {
      Muxer.Write( Image( Frame )->Data(), Image( Frame )->Size() );
    }
    Muxer.Close();
    return SecondsSince( Before, Path );
  }

private:
  const std::shared_ptr<const KVZ::IBufferConst>& Image( size_t i_Frame ) const { return m_Images[i_Frame % m_Images.size()]; }

  double SecondsSince( double i_Before, const std::string& i_rPath ) const
  {
    const double Seconds = ProcessorSeconds() - i_Before;
    if( boost::filesystem::file_size( i_rPath ) < m_Frames * m_Images.front()->Size() )
    {
      throw std::runtime_error( "The file \"" + i_rPath + "\" is too short." );
    }
    boost::filesystem::remove( i_rPath );
    return Seconds;
  }

  const std::string m_Folder;
  const size_t m_Frames;
  std::vector<std::shared_ptr<const KVZ::IBufferConst>> m_Images;
};

// With sound: it has entries of its own in most tables. The memory is the most that was taken at once, while the tables grew.
std::vector<VFigure> MeasureManyFrames( const VMovieCase& i_rCase )
{
  TestSupport::VSparseFile::VPieces Pieces;   // stays empty: from 0 bytes on all counts as an image
  const std::unique_ptr<KVZ::IVideoWriter> pWriter = MakeWriter( i_rCase.m_Container,
    [&Pieces]( const std::string& ) { return std::make_unique<TestSupport::VSparseFile>( Pieces, 0 ); } );
  KVZ::VFrameSet Frame{ std::make_shared<KVZ::IStandardBuffer>( 16 * 2 * 2 ), MakeVideoInfo( 16, 2 ), { std::make_shared<KVZ::IStandardBuffer>( 8 ) },
    { KVZ::IAudioSampleFormat::EInt16, 48000, 1 } };
  WriteHeader( *pWriter, i_rCase, "nowhere", Frame );
  ResetPeakHeapBytes();
  const uint64_t BytesBefore = CountHeapBytes();
  for( uint64_t Number = 0; Number < ManyFrames; ++Number )
  {
    Require( pWriter->WriteFrame( Frame, Number ), i_rCase, "write a frame" );
  }
  const uint64_t TableBytes = CountPeakHeapBytes() - BytesBefore;
  const double Before = ProcessorSeconds();
  Require( pWriter->Close(), i_rCase, "close its file" );
  const double Seconds = ProcessorSeconds() - Before;
  const std::string Name = std::string( "movies, " ) + i_rCase.m_pName;
  return {
    { Name + ", closing 1,000,000 frames, processor time", Seconds, "s", 1.0 },
    { Name + ", memory for tables a frame", static_cast<double>( TableBytes ) / ManyFrames, "B", 64.0 },
  };
}

double Least( const std::vector<double>& i_rValues ) { return *std::min_element( i_rValues.begin(), i_rValues.end() ); }

}

// What disturbs a run only ever adds, so the cheapest of each counts. All take turns.
std::vector<VFigure> MeasureMovies( const VBenchOptions& i_rOptions )
{
  std::vector<VFigure> Figures;
  const VMovieComparison Comparison( i_rOptions.m_Folder, i_rOptions.m_bQuick ? 100 : 300 );
  std::array<std::vector<double>, Cases.size()> Plain;
  std::array<std::vector<double>, Cases.size()> Own;
  std::array<std::vector<double>, Cases.size()> FFmpeg;
  for( int Round = 0; Round < 5; ++Round )
  {
    for( size_t Case = 0; Case < Cases.size(); ++Case )
    {
      Plain[Case].push_back( Comparison.RunPlainLoop() );
      Own[Case].push_back( Comparison.RunWriter( Cases[Case] ) );
      if( VFFmpegMuxer::IsAvailable() )
      {
        FFmpeg[Case].push_back( Comparison.RunFFmpeg( Cases[Case] ) );
      }
    }
  }
  for( size_t Case = 0; Case < Cases.size(); ++Case )
  {
    const std::string Name = std::string( "movies, " ) + Cases[Case].m_pName;
    Figures.push_back(
      { Name + " over plain write calls, processor time", Least( Own[Case] ) / Least( Plain[Case] ), "x", Cases[Case].m_PlainLoopBound } );
    if( !FFmpeg[Case].empty() )
    {
      Figures.push_back( { Name + " over FFmpeg's muxer, processor time", Least( Own[Case] ) / Least( FFmpeg[Case] ), "x", 1.0 } );
    }
    for( VFigure& rFigure : MeasureManyFrames( Cases[Case] ) )
    {
      Figures.push_back( std::move( rFigure ) );
    }
  }
  return Figures;
}
