// Collects the assertions that fail while it lives and meet no handler but the default one, which logs them.
#pragma once

#include "tests/support/LogCapture.h"

#include <string>
#include <vector>

namespace TestSupport
{

class VAssertionCapture
{
public:
  // Their expressions, in order.
  std::vector<std::string> Expressions() const
  {
    std::vector<std::string> Expressions;
    for( const std::string& rText : m_Log.Texts() )
    {
      Expressions.push_back( rText.substr( rText.find( ": " ) + 2 ) );
    }
    return Expressions;
  }

private:
  const VLogCapture m_Log{ "DebugServices" };
};

}
