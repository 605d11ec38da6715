// A data source for devices that deliver frames only when triggered. Its frames have no clock but the counter; a global session begins once
// the frames of the time before have stopped. Every arming makes it wait again: a host does not arm it for the session that it asks for
// itself, once it runs.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSource.h"

#include <boost/thread/mutex.hpp>

#include <cstdint>
#include <memory>

namespace VideoInputHAL
{

class VVideoInputDataSourceTriggered : public VVideoInputDataSource
{
public:
  enum EState : uint32_t
  {
    Unarmed = 0,   // no session has been armed yet: frames are not taken
    Armed = 1,     // waiting for a quiet period: frames are not taken
    Running = 2    // frames are taken
  };

  VVideoInputDataSourceTriggered( std::shared_ptr<VVideoInputDeviceManager> i_pManager, std::shared_ptr<IVideoInputDevice> i_pDevice,
    const std::shared_ptr<VVideoInputDataSourceAllocator>& i_pAllocator, std::shared_ptr<StageCorePluginInterface::IServiceObject> i_pTriggerService,
    const std::shared_ptr<StageCorePluginInterface::IServiceObject>& i_pFirstService,
    const std::shared_ptr<StageCorePluginInterface::IServiceObject>& i_pSecondService,
    std::shared_ptr<StageCorePluginInterface::ICaptureTargets> i_pCaptureTargets, std::shared_ptr<StageCorePluginInterface::ITimeService> i_pTime,
    VVideoInputDataSourceOptions i_Options );
  ~VVideoInputDataSourceTriggered() override;

  EState GetState() const;

protected:
  bool ReadClocks( const VDelivered& i_rDelivered, SyncSystem::VIncomingFrame& io_rFrame ) override;
  bool PrepareForGlobalSyncSession( KVZ::VGlobalSyncSessionId i_Id, const std::shared_ptr<KVZ::IBaseLineClock>& i_pClock,
    SyncSystem::VTriggerPlan& o_rPlan ) override;
  bool OnGlobalSyncSessionDeclared() override { return GetState() == Armed; }
  void OnArmGlobalSyncSession() override;

private:
  void WaitForQuiet() REQUIRES( m_StateMutex );
  void OnQuiet( uint64_t i_Wait );

  const std::shared_ptr<StageCorePluginInterface::IServiceObject> m_pTriggerService;

  mutable boost::mutex m_StateMutex;
  std::unique_ptr<IDeadlineTimer> m_pTimer GUARDED_BY( m_StateMutex );
  EState m_State GUARDED_BY( m_StateMutex ) = Unarmed;
  uint64_t m_Wait GUARDED_BY( m_StateMutex ) = 0;   // the newest wait; earlier ones have lost their meaning
};

}
