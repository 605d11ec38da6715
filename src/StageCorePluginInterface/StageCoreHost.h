// The services that the host hands to a module at Initialise. The host object outlives the module's engine.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/Timecode.h"
#include "NotificationSystem/IPostalService.h"
#include "NotificationSystem/MultiCallback.h"
#include "StageCoreParameters/CaptureFolders.h"
#include "StageCoreParameters/ParameterRegistry.h"
#include "StageCoreRuntime/ShutdownObject.h"
#include "SyncSystem/ISource.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

class IDataStore;

namespace UtilsMemory
{
class VBalancingAllocator;
}

namespace KVZ
{
class IFlowNodeFactory;
}

namespace StageCorePluginInterface
{

using KVZ::IFlowNodeFactory;

// Destroys what it was given when the host stops, in reverse order.
class IShutdownManager
{
public:
  virtual ~IShutdownManager() = default;
  virtual void AddShutdownObject( std::unique_ptr<KVZ::Detail::IShutdownObject> i_pObject ) = 0;
};

class IFlowNodeRegistry
{
public:
  virtual ~IFlowNodeRegistry() = default;
  virtual void RegisterFactory( std::shared_ptr<IFlowNodeFactory> i_pFactory ) = 0;   // a plug-in's factories
  virtual void AddFactory( std::shared_ptr<IFlowNodeFactory> i_pFactory ) = 0;        // an engine's own
};

// Fires once, when modules may look for hardware.
class IHardwareStartEvent
{
public:
  // A null postal service: on the thread that fires the event.
  virtual void Add( std::function<void()> i_Callback, std::shared_ptr<KVZ::IPostalService> i_pService ) = 0;
  virtual ~IHardwareStartEvent() = default;
};

// The host's register of data sources, with the master clock that all of them are laid against.
class ISourceRegistry
{
public:
  virtual void AddSource( std::shared_ptr<KVZ::ISource> i_pSource ) = 0;
  virtual void RemoveSource( const std::shared_ptr<KVZ::ISource>& i_pSource ) = 0;
  // Empty while the host has no master clock.
  virtual std::shared_ptr<KVZ::IBaseLineClock> GetMasterClock() = 0;
  virtual KVZ::IMultiCallbackPostal<void()>& GetMasterPeriodChangedCallback() = 0;
  virtual ~ISourceRegistry() = default;
};

// Where one file of a capture goes: Folder / (BaseName + "_" + DeviceLabel + "." + Extension). An image sequence has no extension here, and its
// frames go to Folder / (BaseName + "_" + DeviceLabel + "_%FRAME%"), which the writer completes.
struct VCaptureTarget
{
  std::string m_Folder;
  std::string m_BaseName;
  std::string m_Extension;   // without the dot
  std::string m_DeviceLabel;
  int32_t m_Container = 0;                  // KVZ::IVideoContainer::Enum
  int32_t m_VideoPayload = 0;               // KVZ::IVideoPayload::Enum
  int32_t m_AudioPayload = 0;               // KVZ::IAudioPayload::Enum
  uint32_t m_AudioChannels = 0xFFFFFFFFu;   // channels to keep; all ones keeps what was captured
  int32_t m_PixelFormat = 0;                // KVZ::IPixelFormat::Enum of uncompressed video; 0 keeps what was captured
  int32_t m_JPEGQuality = 0;                // 1 to 100; 0 leaves the choice to the module
  bool m_bBurnInTimecode = false;           // each frame's timecode is drawn into its picture
  int32_t m_Converter = 0;                  // of pixel formats: 1 OpenGL, 2 software, 3 OpenGL where it alone can; 0 leaves it to the module
  bool m_bCorrectLens = false;              // every picture is converted, in its own format if no other is wanted, and the lens undone
  KVZ::VLensDistortionRecord m_Lens{};
};

// What became of one file of a capture.
struct VCaptureFileReport
{
  KVZ::VCaptureSessionId m_CaptureSessionId;
  std::string m_DeviceURN;
  std::string m_Path;        // of an image sequence the folder and the pattern of its names
  int32_t m_Container = 0;   // KVZ::IVideoContainer::Enum
  uint64_t m_FramesWritten = 0;
  uint64_t m_Bytes = 0;   // of the file after it was closed; of an image sequence all files in its folder
  bool m_bFailed = false;
  std::string m_Error;                           // empty unless failed
  KVZ::ITimecode m_StartTimecode;                // of the first frame
  KVZ::VTick m_StartTick = KVZ::VTick::Open();   // global tick of the first frame
  KVZ::VTick m_Period;
};

class ICaptureTargets : public ICaptureFolders
{
public:
  // The container formats that a capture of this device asks for, by value of KVZ::IVideoContainer::Enum.
  virtual std::vector<int32_t> GetContainers( const std::string& i_rDeviceURN ) = 0;
  // False where there is no target: no folder, or a file that is there already.
  virtual bool GetTarget( const KVZ::ICaptureHeader& i_rHeader, const std::string& i_rDeviceURN, int32_t i_Container, VCaptureTarget& o_rTarget ) = 0;
  // Once a file, when it has been closed or could not be made. On the writing thread.
  virtual void OnFileFinished( const VCaptureFileReport& ) {}
};

// The host's time, for delivery times and the engine's own decisions. Tests inject one that they move by hand.
class ITimeService
{
public:
  virtual ~ITimeService() = default;
  // Seconds of the monotonic clock, above 0.
  virtual double Now() = 0;
};

// A service that a module takes for a while and gives back.
class IServiceObject
{
public:
  virtual std::string GetServiceName() const = 0;
  virtual void Release() = 0;
  virtual ~IServiceObject() = default;
};

// The order of the operations is binding; each returns a shared owner.
class IStageCoreHost
{
public:
  virtual std::shared_ptr<IShutdownManager> GetShutdownManager() = 0;
  virtual std::shared_ptr<UtilsMemory::VBalancingAllocator> GetBalancingAllocator() = 0;
  virtual std::shared_ptr<IDataStore> GetDataStore() = 0;
  virtual std::shared_ptr<ITimeService> GetTimeService() = 0;
  virtual std::shared_ptr<IFlowNodeRegistry> GetFlowNodeRegistry() = 0;
  virtual std::shared_ptr<IParameterRegistry> GetParameterRegistry() = 0;
  virtual std::shared_ptr<IHardwareStartEvent> GetHardwareStartEvent() = 0;
  virtual std::shared_ptr<IServiceObject> GetTriggerService() = 0;          // for triggered devices only
  virtual std::shared_ptr<IServiceObject> GetFirstSourceService() = 0;      // held while a data source is made
  virtual std::shared_ptr<IServiceObject> GetSecondSourceService() = 0;     // likewise
  virtual std::shared_ptr<ICaptureTargets> GetCaptureTargetService() = 0;   // as a data source uses it
  virtual std::shared_ptr<ISourceRegistry> GetSourceRegistry() = 0;
  virtual std::shared_ptr<ICaptureTargets> GetCaptureTargets() = 0;   // as the parameter handlers use it
  // Kind 2: the video files that the host offers to open.
  virtual void SetFileFilters( int i_Kind, const std::vector<std::string>& i_rFilters ) = 0;
  virtual ~IStageCoreHost() = default;
};

}
