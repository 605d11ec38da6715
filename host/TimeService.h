// The host's time: the monotonic clock, and calls that are due later.
#pragma once

#include "StageCorePluginInterface/StageCoreHost.h"

#include <functional>
#include <memory>

namespace NotificationSystem
{
class VAsioPostalService;
}

namespace StageHost
{

class VMonotonicTime : public StageCorePluginInterface::ITimeService
{
public:
  double Now() override;
};

class IDelayedCalls
{
public:
  virtual ~IDelayedCalls() = default;
  // Once, on the service that the implementation names. Any thread.
  virtual void CallAfter( double i_Seconds, std::function<void()> i_Function ) = 0;
};

// On the thread of a postal service, whose queue it keeps from running empty until the calls were made.
class VAsioDelayedCalls : public IDelayedCalls
{
public:
  explicit VAsioDelayedCalls( std::shared_ptr<NotificationSystem::VAsioPostalService> i_pService );
  void CallAfter( double i_Seconds, std::function<void()> i_Function ) override;

private:
  const std::shared_ptr<NotificationSystem::VAsioPostalService> m_pService;
};

}
