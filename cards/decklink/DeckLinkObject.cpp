#include "cards/decklink/DeckLinkObject.h"

#include <array>

namespace VirtualCards
{

using namespace DeckLinkAPI;

namespace
{

constexpr const char* Model = "DeckLink Virtual";
constexpr int64_t CaptureOnly = 1;
constexpr int64_t SDIConnection = 1;

struct VFlagRow
{
  uint32_t m_Id;
  bool m_bValue;
};

constexpr std::array Flags = {
  VFlagRow{ AttributeId::SupportsInputFormatDetection, true },
  VFlagRow{ AttributeId::HasLTCTimecodeInput, false },
  VFlagRow{ AttributeId::SupportsFullDuplex, false },
};

struct VIntRow
{
  uint32_t m_Id;
  int64_t m_Value;
};

constexpr std::array Ints = {
  VIntRow{ AttributeId::MaximumAudioChannels, 16 },
  VIntRow{ AttributeId::NumberOfSubDevices, 1 },
  VIntRow{ AttributeId::SubDeviceIndex, 0 },
  VIntRow{ AttributeId::VideoIOSupport, CaptureOnly },
  VIntRow{ AttributeId::VideoInputConnections, SDIConnection },
};

std::string DisplayName( uint32_t i_Number )
{
  std::string Name = Model;
  Name += " (";
  Name += std::to_string( i_Number );
  Name += ")";
  return Name;
}

template<class TRows, class TValue>
HRESULT FindRow( const TRows& i_rRows, uint32_t i_Id, TValue* o_pValue )
{
  for( const auto& [Id, Value] : i_rRows )
  {
    if( Id == i_Id )
    {
      *o_pValue = Value;
      return S_OK;
    }
  }
  return E_INVALIDARG;
}

}

HRESULT VAttributes::GetFlag( uint32_t i_Id, bool* o_pValue ) { return o_pValue ? FindRow( Flags, i_Id, o_pValue ) : E_POINTER; }

HRESULT VAttributes::GetInt( uint32_t i_Id, int64_t* o_pValue )
{
  if( !o_pValue )
  {
    return E_POINTER;
  }
  if( i_Id == AttributeId::PersistentId || i_Id == AttributeId::TopologicalId || i_Id == AttributeId::DeviceGroupId )
  {
    *o_pValue = m_Number;
    return S_OK;
  }
  return FindRow( Ints, i_Id, o_pValue );
}

HRESULT VAttributes::GetFloat( uint32_t, double* o_pValue ) { return o_pValue ? E_INVALIDARG : E_POINTER; }

HRESULT VAttributes::GetString( uint32_t i_Id, const char** o_ppValue )
{
  switch( i_Id )
  {
    case AttributeId::VendorName: return GiveText( "Blackmagic", o_ppValue );
    case AttributeId::ModelName: return GiveText( Model, o_ppValue );
    case AttributeId::DisplayName: return GiveText( m_Name, o_ppValue );
    case AttributeId::DeviceHandle: return GiveText( "virtual:" + std::to_string( m_Number ), o_ppValue );
    default: return E_INVALIDARG;
  }
}

VDeckLinkObject::VDeckLinkObject( uint32_t i_Number, std::weak_ptr<VVirtualDeckLink> i_pCard )
  : m_Name( DisplayName( i_Number ) ), m_Attributes( *this, m_Name, i_Number ), m_Input( *this, std::move( i_pCard ) )
{
}

HRESULT VDeckLinkObject::QueryInterface( REFIID i_Id, void** o_ppObject )
{
  if( !o_ppObject )
  {
    return E_POINTER;
  }
  *o_ppObject = nullptr;
  if( i_Id == IID_IUnknown || i_Id == IID_IDeckLink )
  {
    *o_ppObject = static_cast<IDeckLink*>( this );
  }
  else if( i_Id == IID_IDeckLinkInput )
  {
    *o_ppObject = static_cast<IDeckLinkInput*>( &m_Input );
  }
  else if( i_Id == IID_IDeckLinkAttributes || i_Id == IID_IDeckLinkProfileAttributes )
  {
    *o_ppObject = static_cast<IDeckLinkAttributes*>( &m_Attributes );
  }
  if( !*o_ppObject )
  {
    return E_NOINTERFACE;
  }
  AddRef();
  return S_OK;
}

ULONG VDeckLinkObject::Release()
{
  const ULONG Left = m_References.Release();
  if( Left == 0 )
  {
    delete this;
  }
  return Left;
}

void VDeckLinkObject::ReleaseOwn()
{
  if( m_References.ReleaseOwn() )
  {
    delete this;
  }
}

HRESULT VDeckLinkObject::GetModelName( const char** o_ppName ) { return GiveText( Model, o_ppName ); }

HRESULT VDeckLinkObject::GetDisplayName( const char** o_ppName ) { return GiveText( m_Name, o_ppName ); }

}
