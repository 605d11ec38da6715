// A private X server, on a display that it has picked itself. Throws where it does not start.
#pragma once

#include "tests/support/ProgramRun.h"

#include <stdexcept>

namespace SystemTests
{

class VPrivateDisplay : public TestSupport::VProgram
{
public:
  VPrivateDisplay() : VProgram( { "Xvfb", "-displayfd", "1", "-screen", "0", "720x576x24", "-nolisten", "tcp" } )
  {
    constexpr double PatienceSeconds = 30.0;
    if( !WaitFor( "\n", PatienceSeconds ) )
    {
      throw std::runtime_error( "no X server: " + Printed() );
    }
  }
  // The number is the last line that it prints.
  std::string Name() const
  {
    const std::string& rPrinted = Result().m_Output;
    const size_t End = rPrinted.find_last_of( "0123456789" );
    const size_t Before = rPrinted.find_last_not_of( "0123456789", End );
    return ":" + rPrinted.substr( Before + 1, End - Before );
  }
};

}
