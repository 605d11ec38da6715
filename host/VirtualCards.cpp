#include "host/VirtualCards.h"

#include "cards/common/VirtualCardControl.h"
#include "host/ModuleLoader.h"

#include <boost/filesystem/operations.hpp>

#include <dlfcn.h>

namespace StageHost
{

namespace
{

struct VKindRow
{
  const char* m_pKind;
  const char* m_pLibrary;   // in the folder "cards" beside the program
};

constexpr VKindRow Kinds[] = { { "decklink", "libDeckLinkAPI.so" }, { "bluefish444", "libBlueVelvetC64.so" } };

// The kinds whose library this build has.
std::string AvailableKinds()
{
  std::string Names;
  for( const VKindRow& rRow : Kinds )
  {
    if( boost::filesystem::exists( ProgramFolder() + "/cards/" + rRow.m_pLibrary ) )
    {
      Names += ( Names.empty() ? "" : ", " ) + std::string( rRow.m_pKind );
    }
  }
  return Names;
}

}

VirtualCards::IVirtualCardControl* VVirtualCards::Load( const std::string& i_rKind, std::string& o_rError )
{
  const auto Loaded = m_Controls.find( i_rKind );
  if( Loaded != m_Controls.end() )
  {
    return Loaded->second;
  }
  for( const VKindRow& rRow : Kinds )
  {
    const std::string Path = ProgramFolder() + "/cards/" + rRow.m_pLibrary;
    if( i_rKind != rRow.m_pKind || !boost::filesystem::exists( Path ) )
    {
      continue;
    }
    void* const pHandle = dlopen( Path.c_str(), RTLD_NOW | RTLD_GLOBAL );
    const auto pGet = pHandle
      ? reinterpret_cast<VirtualCards::GetVirtualCardControlFunction*>( dlsym( pHandle, VirtualCards::GetVirtualCardControlName ) )
      : nullptr;
    if( !pGet )
    {
      o_rError = "The virtual cards of \"" + Path + "\" cannot be loaded: " + dlerror();
      return nullptr;
    }
    return m_Controls[i_rKind] = pGet();
  }
  o_rError = "card \"" + i_rKind + "\": there is no such kind of virtual card; there are: " + AvailableKinds();
  return nullptr;
}

VVirtualCards::~VVirtualCards()
{
  for( const auto& rCard : m_Cards )
  {
    rCard.first->RemoveCard( rCard.second );
  }
}

size_t VVirtualCards::CountDevices() const
{
  size_t Count = 0;
  for( const auto& rCard : m_Cards )
  {
    Count += rCard.first->CountDevices( rCard.second );
  }
  return Count;
}

bool VVirtualCards::Add( const std::string& i_rText, std::string& o_rError )
{
  VirtualCards::IVirtualCardControl* const pControl = Load( i_rText.substr( 0, i_rText.find( ':' ) ), o_rError );
  const uint32_t Card = pControl ? pControl->AddCard( i_rText.c_str(), {}, o_rError ) : 0;
  if( Card != 0 )
  {
    m_Cards.emplace_back( pControl, Card );
  }
  return Card != 0;
}

}
