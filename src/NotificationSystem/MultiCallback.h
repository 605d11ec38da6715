// A multi-callback: an ordered list of callables that a publisher invokes, on its own thread or through postal services.
// Every operation may be called from any thread, also from inside a call; a running round goes through the list as it stood when
// the round began. No lock is held while a callable runs or is destroyed. A call allocates nothing but what a Post needs.
#pragma once

#include "NotificationSystem/Callback.h"

#include <algorithm>
#include <cstddef>
#include <map>
#include <vector>

namespace KVZ
{
template<class TSignature>
class IMultiCallback
{
public:
  IMultiCallback() = default;
  IMultiCallback( const IMultiCallback& ) = delete;
  IMultiCallback& operator=( const IMultiCallback& ) = delete;

  // Appends, and returns the handle for Remove.
  virtual void* Add( std::function<TSignature> i_Function ) = 0;
  // 1 if the entry of this handle went, 0 if there is none.
  virtual size_t Remove( void* i_pHandle ) = 0;
  // Returns how many went.
  virtual size_t Clear() = 0;
  virtual size_t Count() = 0;
  virtual ~IMultiCallback() = default;
};

template<class TSignature>
class IMultiCallbackPostal : public IMultiCallback<TSignature>
{
public:
  // The plain Add delivers through the default service; these through the given one, or on the publisher's thread.
  using IMultiCallback<TSignature>::Add;
  virtual void* Add( std::function<TSignature> i_Function, std::shared_ptr<IPostalService> i_pService ) = 0;
  virtual void* AddImmediate( std::function<TSignature> i_Function ) = 0;
};
}

namespace NotificationSystem
{
template<class TSignature>
class VMultiCallback;

template<class... TArgs>
class VMultiCallback<void( TArgs... )> : public KVZ::IMultiCallback<void( TArgs... )>
{
public:
  using VFunction = std::function<void( TArgs... )>;
  using VEntry = std::shared_ptr<VFunction>;
  using VList = std::vector<VEntry>;

  void* Add( VFunction i_Function ) override
  {
    const auto pEntry = std::make_shared<VFunction>( std::move( i_Function ) );
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    const auto pList = m_pList ? std::make_shared<VList>( *m_pList ) : std::make_shared<VList>();
    pList->push_back( pEntry );
    m_pList = pList;
    return pEntry.get();
  }

  size_t Remove( void* i_pHandle ) override { return Extract( i_pHandle ) ? 1 : 0; }

  size_t Clear() override
  {
    const auto pFormer = ExtractAll();
    return pFormer ? pFormer->size() : 0;
  }

  size_t Count() override
  {
    const auto pList = Current();
    return pList ? pList->size() : 0;
  }

  // Takes an entry, or all, out of the list, for a caller that must not destroy them yet. Empty if there is nothing to take.
  VEntry Extract( void* i_pHandle )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return ExtractLocked( i_pHandle );
  }

  std::shared_ptr<const VList> ExtractAll()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return std::exchange( m_pList, nullptr );
  }

  // Invokes the entries in order of registration. True if one ran to a normal end. Entries that deregister are removed; any other
  // exception passes to the caller and leaves the rest uncalled.
  bool operator()( TArgs... i_Args )
  {
    const auto pList = Current();
    if( !pList )
    {
      return false;
    }
    bool bRan = false;
    std::vector<void*> Gone;
    for( const VEntry& pEntry : *pList )
    {
      try
      {
        ( *pEntry )( i_Args... );
        bRan = true;
      }
      catch( const VDeregisterWeakCallbackException& )
      {
        Gone.push_back( pEntry.get() );
      }
    }
    for( void* pHandle : Gone )
    {
      Remove( pHandle );
    }
    return bRan;
  }

private:
  std::shared_ptr<const VList> Current()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_pList;
  }

  VEntry ExtractLocked( void* i_pHandle ) REQUIRES( m_Mutex )
  {
    if( !m_pList )
    {
      return nullptr;
    }
    const auto IsIt = [i_pHandle]( const VEntry& i_pEntry ) { return i_pEntry.get() == i_pHandle; };
    const auto Found = std::find_if( m_pList->begin(), m_pList->end(), IsIt );
    if( Found == m_pList->end() )
    {
      return nullptr;
    }
    VEntry pEntry = *Found;
    auto pList = std::make_shared<VList>( m_pList->begin(), Found );
    pList->insert( pList->end(), Found + 1, m_pList->end() );
    m_pList = pList->empty() ? nullptr : std::move( pList );
    return pEntry;
  }

  boost::mutex m_Mutex;
  std::shared_ptr<const VList> m_pList GUARDED_BY( m_Mutex );   // replaced on change, never changed; empty pointer for an empty list
};

template<class TSignature>
class VMultiCallbackPostal;

template<class... TArgs>
class VMultiCallbackPostal<void( TArgs... )> : public KVZ::IMultiCallbackPostal<void( TArgs... )>
{
public:
  using VFunction = std::function<void( TArgs... )>;

  // An empty default service means the publisher's thread.
  explicit VMultiCallbackPostal( std::shared_ptr<KVZ::IPostalService> i_pDefaultService = nullptr )
    : m_pDefaultService( std::move( i_pDefaultService ) )
  {
  }

  void* Add( VFunction i_Function ) override { return AddTo( std::move( i_Function ), m_pDefaultService ); }
  void* Add( VFunction i_Function, std::shared_ptr<KVZ::IPostalService> i_pService ) override { return AddTo( std::move( i_Function ), i_pService ); }
  void* AddImmediate( VFunction i_Function ) override { return AddTo( std::move( i_Function ), nullptr ); }

  size_t Remove( void* i_pHandle ) override
  {
    typename VInner::VEntry pRemoved;   // like the former map with its services, it ends without the lock
    std::shared_ptr<const VMap> pFormer;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( !m_pMap )
    {
      return 0;
    }
    for( auto Entry = m_pMap->begin(); Entry != m_pMap->end() && !pRemoved; ++Entry )
    {
      pRemoved = Entry->second->Extract( i_pHandle );
    }
    pFormer = DropEmptyListsLocked();
    return pRemoved ? 1 : 0;
  }

  size_t Clear() override
  {
    std::vector<std::shared_ptr<const typename VInner::VList>> Removed;
    std::shared_ptr<const VMap> pFormer;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    pFormer = std::exchange( m_pMap, nullptr );
    if( !pFormer )
    {
      return 0;
    }
    size_t Count = 0;
    for( const auto& [pService, pInner] : *pFormer )
    {
      Removed.push_back( pInner->ExtractAll() );
      Count += Removed.back() ? Removed.back()->size() : 0;
    }
    return Count;
  }

  size_t Count() override
  {
    const auto pMap = Current();
    if( !pMap )
    {
      return 0;
    }
    size_t Count = 0;
    for( const auto& [pService, pInner] : *pMap )
    {
      Count += pInner->Count();
    }
    return Count;
  }

  // One plain call for the publisher's thread and one posted item a service: order of registration holds within a service, there
  // is none between services. True if a call was made or posted.
  bool operator()( TArgs... i_Args )
  {
    const auto pMap = Current();
    if( !pMap )
    {
      return false;
    }
    bool bCalled = false;
    bool bEmptyList = false;
    for( const auto& [pService, pInner] : *pMap )
    {
      if( pInner->Count() == 0 )
      {
        bEmptyList = true;
      }
      else if( !pService )
      {
        bCalled = ( *pInner )( i_Args... ) || bCalled;
      }
      else
      {
        PostCall( *pService, pInner, i_Args... );
        bCalled = true;
      }
    }
    if( bEmptyList )
    {
      DropEmptyLists();
    }
    return bCalled;
  }

private:
  using VInner = VMultiCallback<void( TArgs... )>;
  using VMap = std::map<std::shared_ptr<KVZ::IPostalService>, std::shared_ptr<VInner>>;

  std::shared_ptr<const VMap> Current()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_pMap;
  }

  void* AddTo( VFunction i_Function, const std::shared_ptr<KVZ::IPostalService>& i_pService )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_pMap )
    {
      const auto Found = m_pMap->find( i_pService );
      if( Found != m_pMap->end() )
      {
        return Found->second->Add( std::move( i_Function ) );
      }
    }
    const auto pMap = m_pMap ? std::make_shared<VMap>( *m_pMap ) : std::make_shared<VMap>();
    const auto pInner = std::make_shared<VInner>();
    pMap->emplace( i_pService, pInner );
    m_pMap = pMap;
    return pInner->Add( std::move( i_Function ) );
  }

  // A list whose subscribers have all deregistered in a posted call no longer keeps its service alive.
  void DropEmptyLists()
  {
    std::shared_ptr<const VMap> pFormer;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    pFormer = DropEmptyListsLocked();
  }

  // Returns the former map, which the caller lets go without the lock: a service may end with it, and joins its threads.
  std::shared_ptr<const VMap> DropEmptyListsLocked() REQUIRES( m_Mutex )
  {
    const auto IsEmpty = []( const typename VMap::value_type& i_rEntry ) { return i_rEntry.second->Count() == 0; };
    if( !m_pMap || std::none_of( m_pMap->begin(), m_pMap->end(), IsEmpty ) )
    {
      return nullptr;
    }
    const auto pMap = std::make_shared<VMap>( *m_pMap );
    std::erase_if( *pMap, IsEmpty );
    return std::exchange( m_pMap, pMap->empty() ? nullptr : pMap );
  }

  const std::shared_ptr<KVZ::IPostalService> m_pDefaultService;
  boost::mutex m_Mutex;
  std::shared_ptr<const VMap> m_pMap GUARDED_BY( m_Mutex );   // replaced on change, never changed; empty pointer for an empty map
};
}
