#include "SyncSystem/DataSourceStrand.h"

namespace SyncSystem
{

namespace
{

thread_local const void* t_pCurrent = nullptr;

struct VCurrentScope
{
  explicit VCurrentScope( const void* i_pStrand ) : m_pFormer( std::exchange( t_pCurrent, i_pStrand ) ) {}
  ~VCurrentScope() { t_pCurrent = m_pFormer; }
  VCurrentScope( const VCurrentScope& ) = delete;
  VCurrentScope& operator=( const VCurrentScope& ) = delete;

  const void* const m_pFormer;
};

}

VStrand::VStrand( std::shared_ptr<KVZ::IPostalService> i_pService )
  : m_pService( std::move( i_pService ) ), m_pIdentity( std::make_shared<VIdentity>() )
{
}

void VStrand::Post( std::function<void()> i_Function, unsigned int i_Unused )
{
  m_pService->Post(
    [pIdentity = m_pIdentity, Function = std::move( i_Function )]
    {
      const VCurrentScope Scope( pIdentity.get() );
      Function();
    },
    i_Unused );
}

bool VStrand::IsCurrent() const { return t_pCurrent == m_pIdentity.get(); }

}
