// One file of a capture: its writer, what it keeps of each frame, and what became of it. One thread at a time.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputBufferClient.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputFrame.h"

#include <cstdint>
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
  VFileRecord( const StageCorePluginInterface::VCaptureTarget& i_rTarget, std::shared_ptr<KVZ::IVideoWriter> i_pWriter );
  ~VFileRecord();

  const std::string& Path() const { return m_Report.m_Path; }
  bool HasFailed() const { return m_Report.m_bFailed; }
  const std::string& Error() const { return m_Report.m_Error; }

  // Makes the folder and the file.
  bool Create();
  // The first frame writes the header before it.
  bool Write( const VFrameView& i_rFrame, const VSettings& i_rSettings, const VDeviceRecord& i_rDevice );
  // Closes what is open. The report is whole afterwards.
  void Close();

  const StageCorePluginInterface::VCaptureFileReport& Report() const { return m_Report; }
  StageCorePluginInterface::VCaptureFileReport& Report() { return m_Report; }

private:
  bool WriteHeader( const VFrameView& i_rFrame, const VSettings& i_rSettings, const VDeviceRecord& i_rDevice );
  KVZ::IVideoAttributes MakeAttributes( const VFrameView& i_rFrame, const VSettings& i_rSettings, const VDeviceRecord& i_rDevice ) const;
  KVZ::AudioFrameInfo KeptAudio( const KVZ::AudioFrameInfo& i_rCaptured ) const;
  bool HasHeaderFormat( const VVideoInputDataSourceFrame& i_rFrame );
  void CollectBuffers( const VFrameView& i_rFrame );
  std::shared_ptr<const KVZ::IBufferConst> KeepChannels( const KVZ::IBufferConst& i_rAudio );
  bool Fail( std::string i_Error );
  bool FailWriter();
  std::string WriteFailureText() const;

  const StageCorePluginInterface::VCaptureTarget m_Target;
  const std::shared_ptr<KVZ::IVideoWriter> m_pWriter;
  const std::shared_ptr<UtilsMemory::VPooledBufferAllocator> m_pAudioAllocator;
  StageCorePluginInterface::VCaptureFileReport m_Report;
  bool m_bCreated = false;
  bool m_bHeaderWritten = false;
  KVZ::VideoFrameInfo m_Video;       // of the header
  KVZ::AudioFrameInfo m_Captured;    // of the first frame
  KVZ::AudioFrameInfo m_Kept;        // of the header
  uint64_t m_PayloadBytes = 0;       // of video, as the writer stored it
  KVZ::VBufferList m_VideoBuffers;   // kept for their memory
  KVZ::VBufferList m_AudioBuffers;
};

}
