// Counted references to the vendor's objects.
#pragma once

#include "VendorInterfaces/DeckLinkAPI.h"

#include <boost/smart_ptr/intrusive_ptr.hpp>

namespace DeckLinkAPI
{

inline void intrusive_ptr_add_ref( IUnknown* i_pObject ) { i_pObject->AddRef(); }

inline void intrusive_ptr_release( IUnknown* i_pObject ) { i_pObject->Release(); }

}

namespace VideoInputHAL
{

template<class T>
using VComPointer = boost::intrusive_ptr<T>;

// Takes over the one reference that an out-parameter or a factory handed over.
template<class T>
VComPointer<T> TakeReference( T* i_pObject )
{
  return VComPointer<T>( i_pObject, false );
}

// Null where the object does not know the interface.
template<class T>
VComPointer<T> QueryInterface( DeckLinkAPI::IUnknown& i_rObject, DeckLinkAPI::REFIID i_Id )
{
  void* pInterface = nullptr;
  const bool bFound = i_rObject.QueryInterface( i_Id, &pInterface ) >= 0;
  return TakeReference( bFound ? static_cast<T*>( pInterface ) : nullptr );
}

}
