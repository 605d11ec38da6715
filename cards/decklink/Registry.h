// The virtual cards of this library, and who wants to know of them.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "cards/common/CardTable.h"
#include "cards/decklink/Discovery.h"

#include <boost/thread/mutex.hpp>

#include <memory>
#include <vector>

namespace VirtualCards
{

// Lives until the process ends, as cards' threads may.
class VRegistry final : public VCardTable
{
public:
  static VRegistry& Instance();

  int64_t ReferencesHeld() const override;
  int64_t ReleaseErrors() const override;
  int32_t CallbacksInFlight() const override;

  // Cards that are in the machine are told at once.
  void Subscribe( const std::shared_ptr<VNotifier>& i_rNotifier );
  void Unsubscribe( const VNotifier& i_rNotifier );

  void CardArrived( VDeckLinkObject& i_rCard );
  void CardRemoved( VDeckLinkObject& i_rCard );
  // In the order of their coming, each with a reference for the caller.
  std::vector<VDeckLinkObject*> PresentCards();

private:
  VRegistry() = default;
  ~VRegistry() = default;

  std::shared_ptr<IVirtualCard> MakeCard( VCardId i_Id, const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError ) override;
  std::vector<std::shared_ptr<VNotifier>> PostToAllLocked( VDeckLinkObject& i_rCard, bool i_bArrived ) REQUIRES( m_Mutex );

  boost::mutex m_Mutex;
  std::vector<VDeckLinkObject*> m_Present GUARDED_BY( m_Mutex );   // held by their cards
  std::vector<std::shared_ptr<VNotifier>> m_Notifiers GUARDED_BY( m_Mutex );
};

}
