// Builds the paths of captures, hands over the formats that each device's parameters hold, and keeps what became of the files. An image sequence
// has a folder of its own, named as the file of another container would be.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/PixelFormat.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <memory>
#include <string>
#include <vector>

class IDataStore;

namespace StageHost
{

struct VCaptureTargetOptions
{
  std::string m_Folder;                     // where the alias "Default" leads
  bool m_bOverwrite = false;                // an existing file, or the images in a folder, are never replaced otherwise
  uint32_t m_AudioChannels = 0xFFFFFFFFu;   // to keep; all ones: as many as were captured and the container can hold
  KVZ::IPixelFormat::Enum m_PixelFormat = KVZ::IPixelFormat::EUnspecified;   // of uncompressed video; "Unspecified" keeps what was captured
  int m_JPEGQuality = 0;                                                     // 1 to 100; 0 leaves the choice to the module
  bool m_bBurnInTimecode = false;
  int32_t m_Converter = 0;       // as VCaptureTarget has it
  bool m_bCorrectLens = false;   // m_Lens is undone
  KVZ::VLensDistortionRecord m_Lens;
};

// What a device is called in file names: the user's name for it, or its URN without the colon.
std::string MakeDeviceLabel( const std::string& i_rDeviceURN, const std::string& i_rName );

// Any thread may call.
class VCaptureTargets : public StageCorePluginInterface::ICaptureTargets
{
public:
  explicit VCaptureTargets( std::shared_ptr<IDataStore> i_pDataStore );

  void Configure( VCaptureTargetOptions i_Options );

  std::vector<int32_t> GetContainers( const std::string& i_rDeviceURN ) override;
  bool GetTarget( const KVZ::ICaptureHeader& i_rHeader, const std::string& i_rDeviceURN, int32_t i_Container,
    StageCorePluginInterface::VCaptureTarget& o_rTarget ) override;
  void GetFolderAliases( std::vector<std::string>& o_rAliases ) override;
  KVZ::IMultiCallbackPostal<void()>& GetFolderAliasesChangedCallback() override { return m_AliasesChanged; }
  void OnFileFinished( const StageCorePluginInterface::VCaptureFileReport& i_rReport ) override;

  // Why a capture of this name could not go to its file now: empty when it can.
  std::string WhyRefused( const std::string& i_rName, const std::string& i_rDeviceURN );

  // Of one capture, in the order in which the files were closed.
  std::vector<StageCorePluginInterface::VCaptureFileReport> GetReports( KVZ::VCaptureSessionId i_Id ) const;

private:
  StageCorePluginInterface::VCaptureTarget MakeTarget( const std::string& i_rName, const std::string& i_rDeviceURN, int32_t i_Container ) const;
  std::string WhyRefused( const StageCorePluginInterface::VCaptureTarget& i_rTarget ) const;
  bool MayOverwrite() const;

  const std::shared_ptr<IDataStore> m_pDataStore;
  NotificationSystem::VMultiCallbackPostal<void()> m_AliasesChanged;
  mutable boost::mutex m_Mutex;
  VCaptureTargetOptions m_Options GUARDED_BY( m_Mutex );
  std::vector<StageCorePluginInterface::VCaptureFileReport> m_Reports GUARDED_BY( m_Mutex );
};

}
