// The virtual cards of this library, and the card objects by which clients reach them.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "VendorInterfaces/BlueVelvet.h"
#include "cards/bluefish444/VirtualBluefish.h"

#include <boost/thread/mutex.hpp>

#include <map>
#include <memory>
#include <optional>

namespace VirtualCards
{

// What a handle stands for: nothing at first, then a card, and of it one input.
struct VCardObject
{
  std::shared_ptr<VVirtualBluefish> m_pCard;   // null while not attached; it may have gone out of the machine
  uint32_t m_Input = 0;                        // counts from 0

  // Null for a card without this input.
  VBluefishInput* Input() const { return m_pCard ? m_pCard->Input( m_Input ) : nullptr; }
};

// Lives until the process ends, as cards' threads may. Any thread may call. A handle counts as a reference that a client holds.
class VBluefishTable final : public VCardTable
{
public:
  static VBluefishTable& Instance();

  int64_t ReferencesHeld() const override;
  int64_t ReleaseErrors() const override;
  int32_t CallbacksInFlight() const override { return 0; }   // this library calls nobody back

  BlueVelvet::VHandle MakeObject();
  void DestroyObject( BlueVelvet::VHandle i_Handle );
  // Empty for what is no handle.
  std::optional<VCardObject> Find( BlueVelvet::VHandle i_Handle ) const;
  bool Attach( BlueVelvet::VHandle i_Handle, int i_Device );
  bool Detach( BlueVelvet::VHandle i_Handle );
  bool SelectInput( BlueVelvet::VHandle i_Handle, uint32_t i_Input );

  // In the machine now; the first has the number 1 for clients.
  std::vector<std::shared_ptr<VVirtualBluefish>> PresentCards() const;

private:
  VBluefishTable() = default;
  ~VBluefishTable() = default;

  std::shared_ptr<IVirtualCard> MakeCard( VCardId i_Id, const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError ) override;

  mutable boost::mutex m_Mutex;
  uintptr_t m_LastHandle GUARDED_BY( m_Mutex ) = 0;
  std::map<BlueVelvet::VHandle, VCardObject> m_Objects GUARDED_BY( m_Mutex );
  int64_t m_ReleaseErrors GUARDED_BY( m_Mutex ) = 0;
};

}
