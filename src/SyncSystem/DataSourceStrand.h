// A postal service in front of another that knows when it is being run: a call that must be ordered with the strand's work is posted and
// waited for, and made in place by a caller that is on the strand already.
#pragma once

#include "NotificationSystem/IPostalService.h"

#include <functional>
#include <future>
#include <memory>
#include <type_traits>
#include <utility>

namespace SyncSystem
{

// Any thread. The wrapped service must run its items one after another for the strand to be one.
class VStrand : public KVZ::IPostalService
{
public:
  explicit VStrand( std::shared_ptr<KVZ::IPostalService> i_pService );

  void Post( std::function<void()> i_Function, unsigned int i_Unused = 0 ) override;

  // The calling thread is running something that was posted here.
  bool IsCurrent() const;

  // Runs the function on the strand, waits, and hands back its result or its exception.
  template<class TFunction>
  std::invoke_result_t<TFunction&> Run( TFunction i_Function )
  {
    if( IsCurrent() )
    {
      return i_Function();
    }
    const auto pTask = std::make_shared<std::packaged_task<std::invoke_result_t<TFunction&>()>>( std::move( i_Function ) );
    auto Result = pTask->get_future();
    Post( [pTask] { ( *pTask )(); } );
    return Result.get();
  }

private:
  struct VIdentity
  {
  };

  const std::shared_ptr<KVZ::IPostalService> m_pService;
  const std::shared_ptr<const VIdentity> m_pIdentity;   // outlives the strand with what is still posted
};

}
