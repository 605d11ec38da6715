// The names that this library shares with the vendor's, and the one of its own.
#include "cards/decklink/DeckLinkObject.h"
#include "cards/decklink/Registry.h"

#include <boost/thread/lock_guard.hpp>

using namespace DeckLinkAPI;
using namespace VirtualCards;

namespace
{

constexpr const char* VersionText = "10.11.4";
constexpr int64_t VersionNumber = 0x0A0B0400;   // major, minor, patch, nothing: a byte each

class VCardIterator final : public VHeapObject<IDeckLinkIterator, IID_IDeckLinkIterator>
{
public:
  VCardIterator() : m_Cards( VRegistry::Instance().PresentCards() ) {}

  HRESULT Next( IDeckLink** o_ppCard ) override
  {
    if( !o_ppCard )
    {
      return E_POINTER;
    }
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    *o_ppCard = m_Next < m_Cards.size() ? m_Cards[m_Next++] : nullptr;   // its reference goes along
    return *o_ppCard ? S_OK : S_FALSE;
  }

private:
  ~VCardIterator() override
  {
    for( ; m_Next < m_Cards.size(); ++m_Next )
    {
      m_Cards[m_Next]->Release();
    }
  }

  boost::mutex m_Mutex;
  const std::vector<VDeckLinkObject*> m_Cards;
  size_t m_Next = 0;
};

class VAPIInformation final : public VHeapObject<IDeckLinkAPIInformation, IID_IDeckLinkAPIInformation>
{
public:
  HRESULT GetFlag( uint32_t, bool* ) override { return E_INVALIDARG; }
  HRESULT GetFloat( uint32_t, double* ) override { return E_INVALIDARG; }

  HRESULT GetInt( uint32_t i_Id, int64_t* o_pValue ) override
  {
    if( i_Id != AttributeId::APIVersion || !o_pValue )
    {
      return o_pValue ? E_INVALIDARG : E_POINTER;
    }
    *o_pValue = VersionNumber;
    return S_OK;
  }

  HRESULT GetString( uint32_t i_Id, const char** o_ppValue ) override
  {
    return i_Id == AttributeId::APIVersion ? GiveText( VersionText, o_ppValue ) : E_INVALIDARG;
  }
};

}

extern "C"
{

  IDeckLinkDiscovery* CreateDeckLinkDiscoveryInstance_0001() { return new VDiscovery; }

  IDeckLinkDiscovery* CreateDeckLinkDiscoveryInstance_0002() { return new VDiscovery; }

  IDeckLinkDiscovery* CreateDeckLinkDiscoveryInstance_0003() { return new VDiscovery; }

  IDeckLinkIterator* CreateDeckLinkIteratorInstance_0002() { return new VCardIterator; }

  IDeckLinkIterator* CreateDeckLinkIteratorInstance_0003() { return new VCardIterator; }

  IDeckLinkIterator* CreateDeckLinkIteratorInstance_0004() { return new VCardIterator; }

  IDeckLinkAPIInformation* CreateDeckLinkAPIInformationInstance_0001() { return new VAPIInformation; }

  IVirtualCardControl* GetVirtualCardControl() { return &VRegistry::Instance(); }
}
