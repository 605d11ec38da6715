// What a long-lived object hands to the host's shutdown manager, so that the host decides when, and on which thread, it ends.
#pragma once

#include "StageCoreRuntime/GlobalLog.h"

#include <memory>
#include <utility>

namespace KVZ::Detail
{
class IShutdownObject
{
public:
  virtual ~IShutdownObject() = default;
};

// Holds its object weakly. Its destructor takes and drops an owner, so that the object is destroyed there, on the thread that
// destroys the shutdown object, if no other owner is left by then.
template<class T>
class VShutdownObject : public IShutdownObject
{
public:
  // The position is where the shutdown object was made: VShutdownObject<VImpl>( pImpl, __FILE__, __LINE__ ).
  VShutdownObject( std::weak_ptr<T> i_pObject, const char* i_pFile, int i_Line )
    : m_pObject( std::move( i_pObject ) ), m_pFile( i_pFile ), m_Line( i_Line )
  {
  }
  VShutdownObject( const VShutdownObject& ) = delete;
  VShutdownObject& operator=( const VShutdownObject& ) = delete;

  ~VShutdownObject() override
  {
    auto pObject = m_pObject.lock();
    if( pObject.use_count() > 1 )
    {
      KVZ_LOG( "Shutdown", 6, "The object of %1%:%2% has %3% other owners at its shutdown.", m_pFile, m_Line, pObject.use_count() - 1 );
    }
    pObject.reset();
  }

private:
  const std::weak_ptr<T> m_pObject;
  const char* const m_pFile;
  const int m_Line;
};
}
