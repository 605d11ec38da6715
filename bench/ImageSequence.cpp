// Image sequences: the same frames compressed and written by one worker thread and by two, as a capture's workers do it.
#include "CoreVideoUtils/FrameSize.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "FileIO/ImageSequenceIO/ImageSequenceWriter.h"
#include "FileIO/VideoEncoding/ImageCompressors.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/FrameWorkers.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/WorkerThreads.h"
#include "bench/Figures.h"
#include "bench/Measuring.h"

#include <boost/filesystem/operations.hpp>
#include <boost/thread/latch.hpp>
#include <boost/thread/thread.hpp>

#include <algorithm>
#include <stdexcept>

namespace
{

using KVZ::IVideoPayload;

constexpr size_t Pictures = 16;     // written over and over
constexpr double LeastGain = 1.8;   // of two threads over one

KVZ::VideoFrameInfo Picture()
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = 1920;
  Info.m_ImageHeight = 1080;
  Info.m_PixelFormat = KVZ::IPixelFormat::EU8Y8V8Y8;
  return Info;
}

// Slopes with some grain, so that the compressor has about as much to do as with a camera's picture.
std::shared_ptr<const KVZ::IBufferConst> MakeFrame( uint32_t i_Number )
{
  auto pFrame = std::make_shared<KVZ::IStandardBuffer>( CoreVideoUtils::GetFrameSize( Picture() ) );
  uint32_t Grain = i_Number + 1;
  for( size_t Byte = 0; Byte < pFrame->Size(); ++Byte )
  {
    Grain = Grain * 1664525 + 1013904223;
    const size_t Column = Byte % 3840;
    const size_t Row = Byte / 3840;
    pFrame->Data()[Byte] = static_cast<uint8_t>(
      Byte % 2 == 0 ? 112 + Row / 40 : 32 + ( Column / 30 + Row / 20 + i_Number ) % 180 + ( Grain >> 29 ) );
  }
  return pFrame;
}

std::shared_ptr<VideoEncoding::VVideoFrameEncoder> MakeEncoder()
{
  VideoEncoding::VEncoderParts Parts;
  Parts.m_ConverterMakers[VideoEncoding::EConverter::Software] = [] { return std::make_shared<CoreVideoUtils::VPixelFormatConverter>(); };
  Parts.m_Compressors = VideoEncoding::ImageCompressors();
  return std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software, Parts );
}

// ImageMagick makes one PNG at a time, and several threads of its own of a TIFF: what two threads gain there is not ours to bound.
struct VPayloadRow
{
  const char* m_pName;
  IVideoPayload::Enum m_Payload;
  size_t m_Frames;
  bool m_bBounded;
};
constexpr VPayloadRow Payloads[] = { { "jpeg", IVideoPayload::EImageJPEG, 128, true }, { "png", IVideoPayload::EImagePNG, 4, false },
  { "tiff", IVideoPayload::EImageTIFF, 8, false } };

// A folder of images, removed again.
class VSequence
{
public:
  VSequence( const std::string& i_rFolder, IVideoPayload::Enum i_Payload ) : m_Folder( i_rFolder + "/images" ), m_Writer( MakeEncoder() )
  {
    if( !m_Writer.Open( m_Folder + "/bench_%FRAME%" ) ||
      !m_Writer.WriteHeader( Picture(), {}, {}, {}, {}, {}, i_Payload, KVZ::IAudioPayload::ENone ) )
    {
      throw std::runtime_error( "The images could not be begun." );
    }
  }
  ~VSequence()
  {
    boost::system::error_code Error;
    boost::filesystem::remove_all( m_Folder, Error );
  }
  VSequence( const VSequence& ) = delete;
  VSequence& operator=( const VSequence& ) = delete;

  VideoInputHAL::VFrameOutcome Write( const std::shared_ptr<const KVZ::IBufferConst>& i_pFrame, uint64_t i_Key )
  {
    return { i_Key, m_Writer.WriteFrame( KVZ::VFrameSet{ i_pFrame, Picture(), {}, {} }, i_Key ) };
  }

private:
  const std::string m_Folder;
  ImageSequenceIO::VImageSequenceWriter m_Writer;
};

// Seconds until the last of the frames is written.
double WriteSequence( const std::string& i_rFolder, const VPayloadRow& i_rPayload, size_t i_Threads,
  const std::vector<std::shared_ptr<const KVZ::IBufferConst>>& i_rPictures )
{
  VSequence Sequence( i_rFolder, i_rPayload.m_Payload );
  boost::latch AllDone( i_rPayload.m_Frames );   // outlives the threads that count it down
  auto pThreads = std::make_shared<VideoInputHAL::VWorkerThreads>( "Bench", i_Threads );
  VideoInputHAL::VFrameWorkers Workers( pThreads, i_rPayload.m_Frames, [&AllDone] { AllDone.count_down(); } );
  const int64_t Begin = NowNanoseconds();
  for( uint64_t Key = 0; Key < i_rPayload.m_Frames; ++Key )
  {
    Workers.Add( 0, [&Sequence, &rPicture = i_rPictures[Key % i_rPictures.size()], Key] { return Sequence.Write( rPicture, Key ); } );
  }
  AllDone.wait();
  const double Seconds = static_cast<double>( NowNanoseconds() - Begin ) * 1e-9;
  const std::vector<VideoInputHAL::VFrameWorkers::VDone> Done = Workers.TakeDone();
  if( std::any_of( Done.begin(), Done.end(), []( const auto& i_rDone ) { return !i_rDone.m_Outcome.m_bWritten; } ) )
  {
    throw std::runtime_error( "An image could not be written." );
  }
  return Seconds;
}

}

// What disturbs a run only ever adds to it: the fastest run of each is compared.
std::vector<VFigure> MeasureImageSequence( const VBenchOptions& i_rOptions )
{
  const int Rounds = i_rOptions.m_bQuick ? 2 : 6;
  std::vector<VFigure> Figures;
  std::vector<std::shared_ptr<const KVZ::IBufferConst>> Frames;
  while( Frames.size() < Pictures )
  {
    Frames.push_back( MakeFrame( static_cast<uint32_t>( Frames.size() ) ) );
  }
  for( const VPayloadRow& rPayload : Payloads )
  {
    double One = 1e9;
    double Two = 1e9;
    for( int Round = 0; Round < Rounds; ++Round )
    {
      One = std::min( One, WriteSequence( i_rOptions.m_Folder, rPayload, 1, Frames ) );
      Two = std::min( Two, WriteSequence( i_rOptions.m_Folder, rPayload, 2, Frames ) );
    }
    const std::string Name = std::string( "images, 1080p " ) + rPayload.m_pName;
    const auto Count = static_cast<double>( rPayload.m_Frames );
    const boost::optional<double> Bound( rPayload.m_bBounded && boost::thread::hardware_concurrency() > 1, 1.0 / LeastGain );
    Figures.push_back( { Name + ", time of two threads over that of one", Two / One, "x", Bound } );
    Figures.push_back( { Name + ", a frame with one thread", One / Count * 1e3, "ms", {} } );
    Figures.push_back( { Name + ", a frame with two threads", Two / Count * 1e3, "ms", {} } );
  }
  return Figures;
}
