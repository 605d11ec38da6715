// Stands before another postal service and makes one call out of a burst of notifications.
#pragma once

#include "NotificationSystem/IPostalService.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <memory>

namespace NotificationSystem
{
// While one function waits in the wrapped service, further ones are dropped: the first of a burst runs. Only for notifications
// without a payload. A post from inside the running function is queued, so the end of a burst is never lost.
// The wrapped service must not run functions inside its Post. Every operation may be called from any thread.
class VDispatchCollapserDontPostIfAnotherQueued : public KVZ::IPostalService,
                                                  public std::enable_shared_from_this<VDispatchCollapserDontPostIfAnotherQueued>
{
public:
  // Empty for an empty service.
  static std::shared_ptr<VDispatchCollapserDontPostIfAnotherQueued> Create( std::shared_ptr<KVZ::IPostalService> i_pService );

  void Post( std::function<void()> i_Function, unsigned int i_Arg = 0 ) override;

private:
  explicit VDispatchCollapserDontPostIfAnotherQueued( std::shared_ptr<KVZ::IPostalService> i_pService );
  void Dispatch( const std::function<void()>& i_rFunction );

  const std::shared_ptr<KVZ::IPostalService> m_pService;
  boost::mutex m_Mutex;
  bool m_bQueued GUARDED_BY( m_Mutex ) = false;
};
}
