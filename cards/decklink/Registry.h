// All virtual cards of this library, and who wants to know of them.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "cards/common/VirtualCardControl.h"
#include "cards/decklink/Discovery.h"

#include <boost/thread/mutex.hpp>

#include <map>
#include <memory>
#include <vector>

namespace VirtualCards
{

class VVirtualDeckLink;

// Lives until the process ends, as cards' threads may.
class VRegistry final : public IVirtualCardControl
{
public:
  static VRegistry& Instance();

  VCardId AddCard( const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError ) override;
  bool RemoveCard( VCardId i_Card ) override;
  bool Step( VCardId i_Card, uint64_t i_Frames ) override;
  bool RunEvent( VCardId i_Card, const char* i_pEvent, std::string& o_rError ) override;
  bool SetBusy( VCardId i_Card, bool i_bBusy ) override;
  bool GetCounters( VCardId i_Card, VCardCounters& o_rCounters ) const override;
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

  std::shared_ptr<VVirtualDeckLink> Find( VCardId i_Card ) const;
  std::vector<std::shared_ptr<VNotifier>> PostToAllLocked( VDeckLinkObject& i_rCard, bool i_bArrived ) REQUIRES( m_Mutex );

  mutable boost::mutex m_Mutex;
  VCardId m_LastId GUARDED_BY( m_Mutex ) = 0;
  std::map<VCardId, std::shared_ptr<VVirtualDeckLink>> m_Cards GUARDED_BY( m_Mutex );
  std::vector<VDeckLinkObject*> m_Present GUARDED_BY( m_Mutex );   // held by their cards
  std::vector<std::shared_ptr<VNotifier>> m_Notifiers GUARDED_BY( m_Mutex );
};

}
