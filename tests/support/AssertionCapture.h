// Collects the assertions that fail while it lives, in place of the handler that was in force.
#pragma once

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <memory>
#include <string>
#include <vector>

namespace TestSupport
{

class VAssertionCapture
{
public:
  VAssertionCapture()
    : m_Former(
        DebugServices::SetAssertFailHandler( [pFound = m_pFound]( const char* i_pExpression, const char*, int ) { pFound->Add( i_pExpression ); } ) )
  {
  }
  ~VAssertionCapture() { DebugServices::SetAssertFailHandler( m_Former ); }
  VAssertionCapture( const VAssertionCapture& ) = delete;
  VAssertionCapture& operator=( const VAssertionCapture& ) = delete;

  // Their expressions, in order.
  std::vector<std::string> Expressions() const { return m_pFound->Copy(); }

private:
  class VFound
  {
  public:
    void Add( const char* i_pExpression )
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Expressions.emplace_back( i_pExpression );
    }
    std::vector<std::string> Copy() const
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      return m_Expressions;
    }

  private:
    mutable boost::mutex m_Mutex;
    std::vector<std::string> m_Expressions GUARDED_BY( m_Mutex );
  };

  const std::shared_ptr<VFound> m_pFound = std::make_shared<VFound>();
  const DebugServices::VAssertFailHandler m_Former;
};

}
