#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSourceTriggered.h"

#include "NotificationSystem/AsioPostalService.h"

#include <boost/thread/lock_guard.hpp>

#include <utility>

namespace VideoInputHAL
{

using StageCorePluginInterface::ICaptureTargets;
using StageCorePluginInterface::IServiceObject;
using StageCorePluginInterface::ITimeService;

namespace
{

constexpr int64_t QuietMicroseconds = 5000000;
constexpr int32_t PlanKind = 1;
constexpr KVZ::VTick PlanPeriod( 2700000 );   // 50 frames a second
constexpr uint32_t SignalType = 4;
constexpr KVZ::VTick SignalDelay( 270000 );
constexpr KVZ::VTick SignalWidth( 540000 );

std::unique_ptr<IDeadlineTimer> MakeTimer( const VVideoInputDataSourceOptions& i_rOptions )
{
  if( i_rOptions.m_MakeTimer )
  {
    return i_rOptions.m_MakeTimer();
  }
  const auto pService = std::dynamic_pointer_cast<KVZ::IAsioPostalService>( i_rOptions.m_pPostalService );
  return pService ? MakeAsioTimer( pService->IoServicePtr() ) : nullptr;
}

}

VVideoInputDataSourceTriggered::VVideoInputDataSourceTriggered( std::shared_ptr<VVideoInputDeviceManager> i_pManager,
  std::shared_ptr<IVideoInputDevice> i_pDevice, const std::shared_ptr<VVideoInputDataSourceAllocator>& i_pAllocator,
  std::shared_ptr<IServiceObject> i_pTriggerService, const std::shared_ptr<IServiceObject>& i_pFirstService,
  const std::shared_ptr<IServiceObject>& i_pSecondService, std::shared_ptr<ICaptureTargets> i_pCaptureTargets, std::shared_ptr<ITimeService> i_pTime,
  VVideoInputDataSourceOptions i_Options )
  : VVideoInputDataSource( std::move( i_pManager ), std::move( i_pDevice ), i_pAllocator, i_pFirstService, i_pSecondService,
      std::move( i_pCaptureTargets ), std::move( i_pTime ), std::move( i_Options ) ),
    m_pTriggerService( std::move( i_pTriggerService ) ),
    m_pTimer( MakeTimer( Options() ) )
{
  if( !m_pTimer )
  {
    KVZ_LOG_ERROR( Log(), "The source's postal service has no timer: once armed, the source takes no frames." );
  }
}

VVideoInputDataSourceTriggered::~VVideoInputDataSourceTriggered() = default;

VVideoInputDataSourceTriggered::EState VVideoInputDataSourceTriggered::GetState() const
{
  boost::lock_guard<boost::mutex> Lock( m_StateMutex );
  return m_State;
}

bool VVideoInputDataSourceTriggered::ReadClocks( const VDelivered&, SyncSystem::VIncomingFrame& )
{
  boost::lock_guard<boost::mutex> Lock( m_StateMutex );
  if( m_State == Armed )
  {
    WaitForQuiet();
  }
  return m_State == Running;
}

bool VVideoInputDataSourceTriggered::PrepareForGlobalSyncSession( KVZ::VGlobalSyncSessionId, const std::shared_ptr<KVZ::IBaseLineClock>&,
  SyncSystem::VTriggerPlan& o_rPlan )
{
  o_rPlan.m_Kind = PlanKind;
  o_rPlan.m_FramePeriod = PlanPeriod;
  o_rPlan.m_BeatPeriod = PlanPeriod;
  o_rPlan.m_Signals["CJS"] = { SignalType, SignalDelay, SignalWidth, true };
  return true;
}

void VVideoInputDataSourceTriggered::OnArmGlobalSyncSession()
{
  boost::lock_guard<boost::mutex> Lock( m_StateMutex );
  m_State = Armed;
  WaitForQuiet();
}

void VVideoInputDataSourceTriggered::WaitForQuiet()
{
  ++m_Wait;
  if( m_pTimer )
  {
    m_pTimer->Set( QuietMicroseconds,
      [pWeak = KVZ::WeakFrom( this ), Wait = m_Wait]
      {
        if( const auto pThis = pWeak.lock() )
        {
          pThis->OnQuiet( Wait );
        }
      } );
  }
}

void VVideoInputDataSourceTriggered::OnQuiet( uint64_t i_Wait )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_StateMutex );
    if( m_State != Armed || i_Wait != m_Wait )
    {
      return;
    }
    m_State = Running;
  }
  RequestNewGlobalSyncSession();
}

}
