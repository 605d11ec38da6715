// Holds one reference on a client's object for as long as anything of ours may call it.
#pragma once

namespace VirtualCards
{

// Not copied: shared through std::shared_ptr, so that no client code runs under a lock of ours when a call in flight still needs it.
template<class TInterface>
class VHeld
{
public:
  explicit VHeld( TInterface* i_pObject ) : m_pObject( i_pObject ) { m_pObject->AddRef(); }
  ~VHeld() { m_pObject->Release(); }
  VHeld( const VHeld& ) = delete;
  VHeld& operator=( const VHeld& ) = delete;

  TInterface* operator->() const { return m_pObject; }

private:
  TInterface* const m_pObject;
};

}
