// Reference counting of the objects that clients hold, with a tally of all of them: who forgets a Release is found out.
#pragma once

#include "VendorInterfaces/DeckLinkAPI.h"

#include <atomic>
#include <cstdint>
#include <string>

namespace VirtualCards
{

// References that clients hold on any object of this library.
int64_t ReferencesHeld();
// Releases without a reference, where they could be noticed.
int64_t ReleaseErrors();

// The count of one object. The library's own reference is kept apart: it is not in the tally, and while it is there a client's
// release too many is noticed and has no effect.
class VReferences
{
public:
  enum class EFirst
  {
    Client,   // the object is made for a client
    Own       // the library keeps it
  };
  explicit VReferences( EFirst i_First );

  unsigned long AddRef();
  // 0: the object has to end.
  unsigned long Release();

  // The library's own. Taken again for an object that is used again, when it has no references.
  void TakeOwn();
  // True if the object has to end.
  bool ReleaseOwn();

private:
  // Clients' references; the library's own is the flag. One word, so that the two can never be seen apart.
  static constexpr unsigned long OwnFlag = 1ul << 62;
  std::atomic<unsigned long> m_State;
};

// An object of one interface that ends with its last reference.
template<class TInterface, DeckLinkAPI::REFIID Id>
class VHeapObject : public TInterface
{
public:
  DeckLinkAPI::HRESULT QueryInterface( DeckLinkAPI::REFIID i_Id, void** o_ppObject ) override
  {
    if( !o_ppObject )
    {
      return DeckLinkAPI::E_POINTER;
    }
    const bool bKnown = i_Id == Id || i_Id == DeckLinkAPI::IID_IUnknown;
    *o_ppObject = bKnown ? static_cast<TInterface*>( this ) : nullptr;
    if( bKnown )
    {
      AddRef();
    }
    return bKnown ? DeckLinkAPI::S_OK : DeckLinkAPI::E_NOINTERFACE;
  }

  DeckLinkAPI::ULONG AddRef() override { return m_References.AddRef(); }

  DeckLinkAPI::ULONG Release() override
  {
    const DeckLinkAPI::ULONG Left = m_References.Release();
    if( Left == 0 )
    {
      delete this;
    }
    return Left;
  }

protected:
  virtual ~VHeapObject() = default;

private:
  VReferences m_References{ VReferences::EFirst::Client };
};

// A text as a client takes it over: on the heap of malloc.
DeckLinkAPI::HRESULT GiveText( const std::string& i_rText, const char** o_ppText );

}
