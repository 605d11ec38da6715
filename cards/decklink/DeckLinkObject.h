// A card as clients see it: one object with three interfaces, made anew each time the card comes into the machine.
#pragma once

#include "VendorInterfaces/DeckLinkAPI.h"
#include "cards/decklink/Input.h"
#include "cards/decklink/References.h"

#include <memory>
#include <string>

namespace VirtualCards
{

class VDeckLinkObject;

class VAttributes final : public DeckLinkAPI::IDeckLinkAttributes
{
public:
  VAttributes( DeckLinkAPI::IUnknown& i_rOwner, std::string i_Name, uint32_t i_Number )
    : m_rOwner( i_rOwner ), m_Name( std::move( i_Name ) ), m_Number( i_Number )
  {
  }
  virtual ~VAttributes() = default;

  DeckLinkAPI::HRESULT QueryInterface( DeckLinkAPI::REFIID i_Id, void** o_ppObject ) override { return m_rOwner.QueryInterface( i_Id, o_ppObject ); }
  DeckLinkAPI::ULONG AddRef() override { return m_rOwner.AddRef(); }
  DeckLinkAPI::ULONG Release() override { return m_rOwner.Release(); }

  // E_INVALIDARG for an id that is not of this type.
  DeckLinkAPI::HRESULT GetFlag( uint32_t i_Id, bool* o_pValue ) override;
  DeckLinkAPI::HRESULT GetInt( uint32_t i_Id, int64_t* o_pValue ) override;
  DeckLinkAPI::HRESULT GetFloat( uint32_t i_Id, double* o_pValue ) override;
  DeckLinkAPI::HRESULT GetString( uint32_t i_Id, const char** o_ppValue ) override;

private:
  DeckLinkAPI::IUnknown& m_rOwner;
  const std::string m_Name;
  const uint32_t m_Number;
};

class VDeckLinkObject final : public DeckLinkAPI::IDeckLink
{
public:
  // Made with the library's own reference.
  VDeckLinkObject( uint32_t i_Number, std::weak_ptr<VVirtualDeckLink> i_pCard );

  DeckLinkAPI::HRESULT QueryInterface( DeckLinkAPI::REFIID i_Id, void** o_ppObject ) override;
  DeckLinkAPI::ULONG AddRef() override { return m_References.AddRef(); }
  DeckLinkAPI::ULONG Release() override;

  DeckLinkAPI::HRESULT GetModelName( const char** o_ppName ) override;
  DeckLinkAPI::HRESULT GetDisplayName( const char** o_ppName ) override;

  VInput& Input() { return m_Input; }
  void ReleaseOwn();

private:
  virtual ~VDeckLinkObject() = default;

  VReferences m_References{ VReferences::EFirst::Own };
  const std::string m_Name;
  VAttributes m_Attributes;
  VInput m_Input;
};

}
