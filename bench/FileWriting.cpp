// From frames in the buffer to bytes in a file: a capture through its buffer client and the writer, against a plain loop of write calls with
// the same bytes from the same memory to the same folder.
#include "StageCorePluginInterface/StageCoreHost.h"
#include "bench/Figures.h"
#include "bench/FrameFeed.h"
#include "bench/Measuring.h"
#include "bench/PlainFile.h"

#include <boost/filesystem/operations.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>
#include <boost/thread/mutex.hpp>

#include <algorithm>
#include <stdexcept>

namespace
{

constexpr uint32_t Width = 1920;
constexpr uint32_t Height = 1080;
constexpr uint32_t ImageBytes = Width * Height * 2;
// Far more than a cache holds, and few enough that a run finds the pages that the run before has given back.
constexpr size_t Frames = 100;

// Sends every capture to one file, and tells when it is closed.
class VOneFile : public StageCorePluginInterface::ICaptureTargets
{
public:
  explicit VOneFile( std::string i_Folder ) : m_Folder( std::move( i_Folder ) ) {}

  std::string Path() const { return m_Folder + "/capture_bench.tvid"; }

  // The report of the file that was closed since the last call.
  StageCorePluginInterface::VCaptureFileReport AwaitFile()
  {
    boost::unique_lock<boost::mutex> Lock( m_Mutex );
    m_Finished.wait( Lock, [this] { return m_bFinished; } );
    m_bFinished = false;
    return m_Report;
  }

  void GetFolderAliases( std::vector<std::string>& ) override {}
  KVZ::IMultiCallbackPostal<void()>& GetFolderAliasesChangedCallback() override { return m_AliasesChanged; }
  std::vector<int32_t> GetContainers( const std::string& ) override { return { KVZ::IVideoContainer::ETVID }; }
  bool GetTarget( const KVZ::ICaptureHeader&, const std::string&, int32_t i_Container, StageCorePluginInterface::VCaptureTarget& o_rTarget ) override
  {
    o_rTarget.m_Folder = m_Folder;
    o_rTarget.m_BaseName = "capture";
    o_rTarget.m_DeviceLabel = "bench";
    o_rTarget.m_Extension = "tvid";
    o_rTarget.m_Container = i_Container;
    o_rTarget.m_VideoPayload = KVZ::IVideoPayload::EUncompressed;
    o_rTarget.m_AudioPayload = KVZ::IAudioPayload::ENone;
    return true;
  }
  void OnFileFinished( const StageCorePluginInterface::VCaptureFileReport& i_rReport ) override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Report = i_rReport;
    m_bFinished = true;
    m_Finished.notify_all();
  }

private:
  const std::string m_Folder;
  NotificationSystem::VMultiCallbackPostal<void()> m_AliasesChanged;
  boost::mutex m_Mutex;
  boost::condition_variable m_Finished;
  bool m_bFinished = false;
  StageCorePluginInterface::VCaptureFileReport m_Report;
};

class VFileComparison
{
public:
  VFileComparison( const std::string& i_rFolder, size_t i_Frames )
    : m_Folder( i_rFolder ), m_pTargets( std::make_shared<VOneFile>( i_rFolder ) ), m_Feed( FeedSettings( i_Frames ) )
  {
    while( m_Images.size() < i_Frames )
    {
      AddFrame();
    }
    m_Feed.JoinSession();
  }

  // Both give processor seconds, up to the closed file. It is removed after that.
  double RunCapture()
  {
    KVZ::ICaptureHeader Header;
    Header.m_CaptureSessionId = KVZ::VCaptureSessionId( ++m_Captures );
    Header.m_Name = "bench";
    Header.m_GlobalSyncSessionId = KVZ::VGlobalSyncSessionId( 1 );
    const KVZ::VTick End = VFrameFeed::Period * static_cast<int64_t>( m_Images.size() );
    const double Before = ProcessorSeconds();
    if( !m_Feed.Source().Capture().StartCapture( Header, KVZ::VTick( 0 ), End, false, 0 ) )
    {
      throw std::runtime_error( "The data source refused a capture." );
    }
    const auto Report = m_pTargets->AwaitFile();
    const double Seconds = ProcessorSeconds() - Before;
    if( Report.m_bFailed || Report.m_FramesWritten != m_Images.size() || boost::filesystem::file_size( m_pTargets->Path() ) < Bytes() )
    {
      throw std::runtime_error( "The capture is not whole: " + Report.m_Error );
    }
    boost::filesystem::remove( m_pTargets->Path() );
    return Seconds;
  }

  double RunPlainLoop() const
  {
    VPlainFile File( m_Folder + "/plain_bench.raw" );
    const double Before = ProcessorSeconds();
    for( const uint8_t* pImage : m_Images )
    {
      File.Write( pImage, ImageBytes );
    }
    File.Close();
    return ProcessorSeconds() - Before;
  }

  uint64_t Bytes() const { return m_Images.size() * uint64_t{ ImageBytes }; }

private:
  // Blocks as the stand-alone host makes them, for nine such frames.
  VFeedSettings FeedSettings( size_t i_Frames ) const
  {
    VFeedSettings Settings;
    Settings.m_FrameBytes = VideoInputHAL::VVideoInputDataSourceFrame::BlockSize( ImageBytes, 0 );
    Settings.m_FramesPerBlock = 9;
    Settings.m_Frames = i_Frames;
    Settings.m_pCaptureTargets = m_pTargets;
    return Settings;
  }

  void AddFrame()
  {
    VideoInputHAL::VVideoInputDataSourceFrame* pFrame = m_Feed.MakeFrame();
    pFrame->m_VideoInfo.m_ImageWidth = Width;
    pFrame->m_VideoInfo.m_ImageHeight = Height;
    pFrame->m_VideoInfo.m_PixelFormat = KVZ::IPixelFormat::EU8Y8V8Y8;
    pFrame->m_ImageBytes = ImageBytes;
    pFrame->m_ImageCapacity = static_cast<uint32_t>( VideoInputHAL::VVideoInputDataSourceFrame::RoundUp( ImageBytes ) );
    std::fill_n( pFrame->Image(), ImageBytes, static_cast<uint8_t>( m_Images.size() + 1 ) );
    m_Images.push_back( pFrame->Image() );
    m_Feed.Deliver( pFrame );
  }

  const std::string m_Folder;
  const std::shared_ptr<VOneFile> m_pTargets;
  VFrameFeed m_Feed;
  std::vector<const uint8_t*> m_Images;   // of the frames in the buffer, which holds them all
  uint32_t m_Captures = 0;
};

}

// What disturbs a run, such as fresh pages that the system first has to get from a machine below it, only ever adds: the cheapest run of
// each tells what the work itself costs.
std::vector<VFigure> MeasureFileWriting( const VBenchOptions& i_rOptions )
{
  const int Pairs = i_rOptions.m_bQuick ? 9 : 40;
  VFileComparison Comparison( i_rOptions.m_Folder, Frames );
  std::vector<double> Capture;
  std::vector<double> Plain;
  for( int Pair = 0; Pair < Pairs; ++Pair )
  {
    const bool bCaptureFirst = Pair % 2 != 0;
    if( bCaptureFirst ) Capture.push_back( Comparison.RunCapture() );
    Plain.push_back( Comparison.RunPlainLoop() );
    if( !bCaptureFirst ) Capture.push_back( Comparison.RunCapture() );
  }
  const double LeastCapture = *std::min_element( Capture.begin(), Capture.end() );
  const double LeastPlain = *std::min_element( Plain.begin(), Plain.end() );
  const double GiB = static_cast<double>( Comparison.Bytes() ) / 1073741824.0;
  return {
    { "file, capture over plain write calls, processor time", LeastCapture / LeastPlain, "x", 1.15 },
    { "file, capture, processor time a GiB", LeastCapture / GiB, "s", {} },
    { "file, plain write calls, processor time a GiB", LeastPlain / GiB, "s", {} },
    { "file, capture, processor time a GiB, median of the runs", Median( Capture ) / GiB, "s", {} },
    { "file, plain write calls, processor time a GiB, median of the runs", Median( Plain ) / GiB, "s", {} },
  };
}
