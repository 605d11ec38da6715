// Turns one capture of a source into files. It is a client of the capture buffer: it takes the frames in order on a thread of its own, at its
// own pace, so that a slow disk costs memory in the buffer and no frames. Files that take several frames at once have them written by worker
// threads; a frame stays pinned until all files have it.
//
// AddDevice and AddFile come first, then Start, once. Stop may be called from any thread but the client's own. Nothing of the source is
// needed: files are finished even if the source goes.
#pragma once

#include "Core/VideoInterface/VideoWriter.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSource.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCoreRuntime/ThreadAnnotations.h"
#include "SyncSystem/DataSourceSession.h"

#include <boost/thread/mutex.hpp>

#include <atomic>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace KVZ
{
class IStandardBufferAllocator;
}

namespace VideoInputHAL
{

class VFrameWorkers;

class VVideoInputBufferClient : public std::enable_shared_from_this<VVideoInputBufferClient>
{
public:
  struct VSettings
  {
    std::shared_ptr<SyncSystem::VCaptureBuffer> m_pBuffer{};
    KVZ::ICaptureHeader m_Header{};
    std::shared_ptr<const SyncSystem::VGlobalSyncSessionInfo> m_pSession{};
    std::shared_ptr<StageCorePluginInterface::ICaptureTargets> m_pCaptureTargets{};   // told of every finished file
    std::shared_ptr<const KVZ::VVideoWriterFactory> m_pWriterFactory{};
    VVideoEncoderSettings m_Encoder{};
    std::shared_ptr<KVZ::IPostalService> m_pPostalService{};   // empty: a service of its own
    std::shared_ptr<KVZ::IPostalService> m_pFrameService{};    // runs workers; empty: threads of its own, where they are needed
  };

  struct VDeviceRecord
  {
    std::string m_URN;
    std::string m_ManufacturerName;
    std::string m_DriverName;
    std::string m_DeviceName;
  };

  explicit VVideoInputBufferClient( VSettings i_Settings );
  ~VVideoInputBufferClient();

  void AddDevice( VDeviceRecord i_Device );
  void AddFile( const StageCorePluginInterface::VCaptureTarget& i_rTarget );
  // Joins the buffer's next capture. Files are made when its first frame comes.
  void Start();
  // Leaves the capture and closes what is open, at the length it has reached.
  void Stop();
  // Files are being made or written. They are closed, and their reports given, before the capture hears of the client's end; but a
  // cancelled capture hears of it first.
  bool HasOpenFiles() const { return m_bFilesOpen; }

  // Frames that workers may hold at a time.
  static size_t FramesAtOnce();

private:
  class VFileRecord;
  struct VFrameView;

  // What is to be told once the client's lock is free.
  struct VNews
  {
    std::vector<StageCorePluginInterface::VCaptureFileReport> m_Reports;
    bool m_bGoOn = false;
    bool m_bFinished = false;   // the buffer is to hear that the client has finished
    std::string m_Failure;      // empty: none
  };

  // Why no more frames are taken. Workers may have some in hand still.
  enum class EEnding
  {
    None,
    Finished,
    Cancelled,
    Failed
  };

  std::function<void()> MakeWake();
  void WriteFrames();
  void TakeTurn( VNews& o_rNews ) REQUIRES( m_Mutex );
  void TakeFrame( VNews& o_rNews ) REQUIRES( m_Mutex );
  bool TryWriteFrame( const SyncSystem::VRefCountedToken& i_rFrame ) REQUIRES( m_Mutex );
  bool WriteFrame( const SyncSystem::VRefCountedToken& i_rFrame ) REQUIRES( m_Mutex );
  bool WriteToFile( size_t i_File, const VFrameView& i_rFrame ) REQUIRES( m_Mutex );
  bool Begin( const VFrameView& i_rFrame ) REQUIRES( m_Mutex );
  bool CreateFiles() REQUIRES( m_Mutex );
  void MakeWorkers() REQUIRES( m_Mutex );
  bool CountDone() REQUIRES( m_Mutex );
  void DropJobs() REQUIRES( m_Mutex );
  void End( VNews& o_rNews ) REQUIRES( m_Mutex );
  void CloseFiles( VNews& o_rNews ) REQUIRES( m_Mutex );
  void LogEnd( const char* i_pFormat ) const REQUIRES( m_Mutex );
  void Tell( const VNews& i_rNews );

  // Fixed after Start
  const VSettings m_Settings;
  const std::shared_ptr<KVZ::IPostalService> m_pPostalService;
  VDeviceRecord m_Device;
  uint32_t m_ClientId = 0;

  std::atomic<bool> m_bFilesOpen{ false };

  boost::mutex m_Mutex;   // held while a frame is written; taken before the buffer's lock
  std::vector<std::unique_ptr<VFileRecord>> m_Files GUARDED_BY( m_Mutex );
  bool m_bStarted GUARDED_BY( m_Mutex ) = false;   // the first frame has been seen and the files made
  EEnding m_Ending GUARDED_BY( m_Mutex ) = EEnding::None;
  std::string m_Failure GUARDED_BY( m_Mutex );   // of the ending
  bool m_bEnded GUARDED_BY( m_Mutex ) = false;
  uint64_t m_Frames GUARDED_BY( m_Mutex ) = 0;   // written to every file, once they are closed
  // Both empty without a file that needs them. They end before the files do, and before the service that workers post to.
  std::shared_ptr<KVZ::IPostalService> m_pFrameService GUARDED_BY( m_Mutex );
  std::unique_ptr<VFrameWorkers> m_pWorkers GUARDED_BY( m_Mutex );
};

}
