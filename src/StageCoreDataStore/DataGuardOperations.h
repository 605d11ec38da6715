// What the four guards have in common: they hold the store's lock for their own life, and each operation goes to the store.
//
// A guard can be moved, on its own thread: the lock passes on without a gap. A guard without a store, because it has been moved from or
// its lock was refused, finds nothing and stores nothing.
#pragma once

#include "StageCoreDataStore/IDataStore.h"
#include "StageCoreRuntime/DebugServices.h"

#include <utility>

namespace DataGuards
{

template<class TInterface>
class VReadOperations : public TInterface
{
public:
  using TInterface::GetDataStore;
  const IDataStore* GetDataStore() const override { return CheckedStore(); }
  bool GetChildNames( const VDataAddress& i_rAddress, std::vector<std::string>& o_rNames ) const override
  {
    return m_pDataStore && m_pDataStore->GetChildNames( i_rAddress, o_rNames );
  }
  bool GetValuePaths( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) const override
  {
    return m_pDataStore && m_pDataStore->GetValuePaths( i_rAddress, o_rPaths );
  }
  bool GetMatches( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) const override
  {
    return m_pDataStore && m_pDataStore->GetMatches( i_rAddress, o_rPaths );
  }
  uint64_t GetChangeStamp( const VDataAddress& i_rAddress ) const override { return m_pDataStore ? m_pDataStore->GetChangeStamp( i_rAddress ) : 0; }
  bool Exists( const VDataAddress& i_rAddress ) const override { return m_pDataStore && m_pDataStore->Exists( i_rAddress ); }
  bool GetValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const override
  {
    return m_pDataStore && m_pDataStore->GetValue( i_rAddress, o_rValue, EDataForm::Both );
  }
  KVZ::Variant GetValue( const VDataAddress& i_rAddress ) const override
  {
    KVZ::Variant Value;
    GetValue( i_rAddress, Value );
    return Value;
  }
  bool IsSettled( const VDataAddress& i_rAddress ) const override { return m_pDataStore && m_pDataStore->IsSettled( i_rAddress ); }
  bool GetValueFlags( const VDataAddress& i_rAddress, uint32_t& o_rFlags ) const override
  {
    return m_pDataStore && m_pDataStore->GetValueFlags( i_rAddress, o_rFlags );
  }
  const KVZ::ISchema* GetSchema( const VDataAddress& i_rAddress ) const override
  {
    const KVZ::ISchema* pSchema = nullptr;
    if( m_pDataStore )
    {
      m_pDataStore->GetSchema( i_rAddress, pSchema );
    }
    return pSchema;
  }
  IDataNode* FindNode( const VDataAddress& i_rAddress ) const override
  {
    IDataNode* pNode = nullptr;
    if( m_pDataStore )
    {
      m_pDataStore->FindNode( i_rAddress, pNode );
    }
    return pNode;
  }
  size_t CountValues( const VDataAddress& i_rAddress ) const override { return m_pDataStore ? m_pDataStore->CountValues( i_rAddress ) : 0; }

protected:
  explicit VReadOperations( IDataStore* i_pDataStore ) : m_pDataStore( i_pDataStore ) {}
  VReadOperations( VReadOperations&& i_rOther ) noexcept : m_pDataStore( std::exchange( i_rOther.m_pDataStore, nullptr ) ) {}

  IDataStore* CheckedStore() const
  {
    KVZ_ASSERT( m_pDataStore != nullptr );
    return m_pDataStore;
  }

  IDataStore* m_pDataStore;
};

template<class TBase>
class VVerifyReadOperations : public TBase
{
public:
  bool GetProposedValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const override
  {
    return this->m_pDataStore && this->m_pDataStore->GetValue( i_rAddress, o_rValue, EDataForm::Proposed );
  }
  bool GetVerifiedValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const override
  {
    return this->m_pDataStore && this->m_pDataStore->GetValue( i_rAddress, o_rValue, EDataForm::Verified );
  }

protected:
  using TBase::TBase;
};

template<class TBase>
class VWriteOperations : public TBase
{
public:
  using TBase::GetDataStore;
  IDataStore* GetDataStore() override { return this->CheckedStore(); }
  IDataNode* GetNode( const VDataPathHandle& i_rHandle ) override { return this->m_pDataStore ? this->m_pDataStore->GetNode( i_rHandle ) : nullptr; }
  IDataNode* GetNode( const VDataPath& i_rPath ) override { return this->m_pDataStore ? this->m_pDataStore->GetNode( i_rPath ) : nullptr; }
  bool SetValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue ) override
  {
    return this->m_pDataStore && this->m_pDataStore->SetValue( i_rAddress, i_rValue, EDataForm::Both );
  }
  bool RemoveValue( const VDataAddress& i_rAddress ) override { return this->m_pDataStore && this->m_pDataStore->RemoveValue( i_rAddress, 0 ); }
  bool RemoveBranch( const VDataAddress& i_rAddress ) override { return this->m_pDataStore && this->m_pDataStore->RemoveBranch( i_rAddress ); }
  bool DiscardProposal( const VDataAddress& i_rAddress ) override { return this->m_pDataStore && this->m_pDataStore->DiscardProposal( i_rAddress ); }
  bool SetValueFlags( const VDataAddress& i_rAddress, uint32_t i_Flags ) override
  {
    return this->m_pDataStore && this->m_pDataStore->SetValueFlags( i_rAddress, i_Flags );
  }

protected:
  using TBase::TBase;
};

template<class TBase>
class VVerifyWriteOperations : public TBase
{
public:
  bool SetProposedValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue ) override
  {
    return this->m_pDataStore && this->m_pDataStore->SetValue( i_rAddress, i_rValue, EDataForm::Proposed );
  }
  bool SetVerifiedValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue ) override
  {
    return this->m_pDataStore && this->m_pDataStore->SetValue( i_rAddress, i_rValue, EDataForm::Verified );
  }

protected:
  using TBase::TBase;
};

template<class TOperations>
class VReadGuard : public TOperations
{
protected:
  explicit VReadGuard( IDataStore& i_rDataStore ) : TOperations( &i_rDataStore )
  {
    uint32_t State = 0;
    i_rDataStore.AcquireReadLock( State );
  }
  VReadGuard( VReadGuard&& ) noexcept = default;

  ~VReadGuard() override
  {
    if( this->m_pDataStore )
    {
      this->m_pDataStore->ReleaseReadLock();
    }
  }
};

template<class TOperations>
class VWriteGuard : public TOperations
{
protected:
  explicit VWriteGuard( IDataStore& i_rDataStore ) : TOperations( &i_rDataStore )
  {
    if( !i_rDataStore.AcquireWriteLock() )
    {
      KVZ_ASSERT( !"Fatal attempt to acquire a write lock from within a read lock." );
      this->m_pDataStore = nullptr;
    }
  }
  VWriteGuard( VWriteGuard&& ) noexcept = default;

  ~VWriteGuard() override
  {
    if( this->m_pDataStore )
    {
      this->m_pDataStore->ReleaseWriteLock();
    }
  }
};

}
