// One file of a capture: its writer, what it keeps of each frame, and what became of it. One thread at a time, but for WriteFrame.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDataSource/FrameConversion.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/FrameWorkers.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputBufferClient.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputFrame.h"

#include <cstdint>
#include <limits>
#include <memory>
#include <string>

namespace VideoInputHAL
{

// A frame as the files of a capture see it.
struct VVideoInputBufferClient::VFrameView
{
  const VVideoInputDataSourceFrame* m_pFrame = nullptr;   // null for an entry without a frame
  std::shared_ptr<const KVZ::IBufferConst> m_pVideo;      // the stored bytes themselves
  std::shared_ptr<const KVZ::IBufferConst> m_pAudio;      // likewise, every channel; empty without audio
  KVZ::VTick m_Tick = KVZ::VTick::Open();                 // global
  KVZ::VTick m_Period;
};

class VVideoInputBufferClient::VFileRecord
{
public:
  VFileRecord( const StageCorePluginInterface::VCaptureTarget& i_rTarget, const VVideoEncoderSettings& i_rSettings,
    std::shared_ptr<KVZ::IVideoWriter> i_pWriter );
  ~VFileRecord();

  const std::string& Path() const { return m_Report.m_Path; }
  bool HasFailed() const { return m_Report.m_bFailed; }
  const std::string& Error() const { return m_Report.m_Error; }

  // Makes the folder and the file.
  bool Create();
  // Its writer takes several frames at once, on any thread.
  bool IsParallel() const { return m_Target.m_Container == KVZ::IVideoContainer::EIMAGES; }
  // Looks at the next frame and gives its key. The first frame writes the header. False ends the file.
  bool Prepare( const VFrameView& i_rFrame, const VSettings& i_rSettings, const VDeviceRecord& i_rDevice, uint64_t& o_rKey );
  // Writes a frame that was prepared. Changes nothing here: of a parallel file several threads may call it at once. Never throws.
  VFrameOutcome WriteFrame( const VFrameView& i_rFrame, uint64_t i_Key ) const noexcept;
  // Takes note of what came of it. False ends the file.
  bool Count( const VFrameOutcome& i_rOutcome );
  // Closes what is open. The report is whole afterwards.
  void Close();

  const StageCorePluginInterface::VCaptureFileReport& Report() const { return m_Report; }
  StageCorePluginInterface::VCaptureFileReport& Report() { return m_Report; }

private:
  bool WriteHeader( const VFrameView& i_rFrame, const VSettings& i_rSettings, const VDeviceRecord& i_rDevice );
  KVZ::IVideoAttributes MakeAttributes( const VFrameView& i_rFrame, const VSettings& i_rSettings, const VDeviceRecord& i_rDevice ) const;
  KVZ::AudioFrameInfo KeptAudio( const KVZ::AudioFrameInfo& i_rCaptured ) const;
  bool HasHeaderFormat( const VVideoInputDataSourceFrame& i_rFrame );
  bool KeepChannels( KVZ::VBufferList& io_rAudio ) const;
  VFrameOutcome TryWriteFrame( const VFrameView& i_rFrame, uint64_t i_Key ) const;
  bool Fail( std::string i_Error );
  bool FailWriter();
  uint64_t CountBytes() const;
  std::string WriteFailureText() const;

  const StageCorePluginInterface::VCaptureTarget m_Target;
  const std::shared_ptr<KVZ::IVideoWriter> m_pWriter;
  const std::shared_ptr<KVZ::IStandardBufferAllocator> m_pAudioAllocator;
  const std::unique_ptr<VFrameConversion> m_pConversion;
  StageCorePluginInterface::VCaptureFileReport m_Report;
  bool m_bCreated = false;
  bool m_bHeaderWritten = false;
  uint64_t m_NextKey = 0;
  uint64_t m_FailedKey = std::numeric_limits<uint64_t>::max();   // the lowest of a frame that could not be written
  KVZ::VideoFrameInfo m_Video;                                   // of the first frame
  KVZ::AudioFrameInfo m_Captured;                                // of the first frame
  KVZ::AudioFrameInfo m_Kept;                                    // of the header
  uint64_t m_PayloadBytes = 0;                                   // of video, as the writer stored it
};

}
