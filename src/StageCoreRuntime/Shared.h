// Base of long-lived objects that are held by shared owners, and the one way to make them.
#pragma once

#include <memory>
#include <type_traits>
#include <utility>

namespace KVZ
{
namespace MakeSharedDetail
{
template<class T>
class VSharedFinal;
}

// Derive, and make with MakeShared. The class stays abstract until MakeShared completes it, so no object of it can live without
// a shared owner.
class VShared : public std::enable_shared_from_this<VShared>
{
public:
  VShared( const VShared& ) = delete;
  VShared& operator=( const VShared& ) = delete;

  // Called right after the shared owner exists: the first place where the object can hand out references to itself.
  virtual void PostConstruct() {}

  // Called once while the whole object still exists, on the thread that lets the last owner go. Weak references are dead by then.
  virtual void PreDestruct() {}

protected:
  VShared() = default;

private:
  template<class T>
  friend class MakeSharedDetail::VSharedFinal;

  virtual void MadeByMakeShared() const = 0;

public:
  virtual ~VShared() = default;
};

namespace MakeSharedDetail
{
template<class T>
class VSharedFinal final : public T
{
public:
  template<class... TArgs>
  explicit VSharedFinal( TArgs&&... i_Args ) : T( std::forward<TArgs>( i_Args )... )
  {
  }

  ~VSharedFinal() override { this->PreDestruct(); }

private:
  void MadeByMakeShared() const override {}
};
}

// Makes a T with its shared owner and calls its PostConstruct. An exception of either leaves nothing behind.
template<class T, class... TArgs>
std::shared_ptr<T> MakeShared( TArgs&&... i_Args )
{
  static_assert( std::is_base_of_v<VShared, T>, "MakeShared makes objects that derive from VShared" );
  const auto pObject = std::make_shared<MakeSharedDetail::VSharedFinal<T>>( std::forward<TArgs>( i_Args )... );
  static_cast<VShared&>( *pObject ).PostConstruct();
  return pObject;
}

// A shared owner of the object itself, with the caller's own type: SharedFrom( this ). Empty during construction and destruction.
template<class T>
std::shared_ptr<T> SharedFrom( T* i_pThis )
{
  const auto pOwner = i_pThis->weak_from_this().lock();
  return pOwner ? std::shared_ptr<T>( pOwner, i_pThis ) : nullptr;
}

// The same as a weak reference, for callbacks: BindWeak( WeakFrom( this ), &VImpl::OnDeviceAdded ).
template<class T>
std::weak_ptr<T> WeakFrom( T* i_pThis )
{
  return SharedFrom( i_pThis );
}
}
