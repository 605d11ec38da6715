// A program that runs beside the test, until the test lets go of it.
#pragma once

#include <chrono>
#include <string>
#include <vector>

#include <sys/types.h>

namespace SystemTests
{

class VBackgroundProgram
{
public:
  // The name is looked up. Its standard output and error come through one pipe.
  VBackgroundProgram( const std::vector<std::string>& i_rArguments, const std::vector<std::string>& i_rEnvironment = {} );
  // Ends it and waits for its end.
  ~VBackgroundProgram();
  VBackgroundProgram( const VBackgroundProgram& ) = delete;
  VBackgroundProgram& operator=( const VBackgroundProgram& ) = delete;

  // Until it has printed this text. False when it ends or so many seconds pass before that.
  bool WaitFor( const std::string& i_rText, double i_Seconds );
  // Sends INT.
  void Interrupt() const;
  // Until it has ended and everything that it printed is here: its exit code. -1 when a signal ended it or so many seconds pass before that.
  int WaitForEnd( double i_Seconds );
  const std::string& Printed() const { return m_Printed; }

private:
  int WaitForEnd();
  // False at the end of its output or at the deadline.
  bool ReadMore( std::chrono::steady_clock::time_point i_Deadline );

  pid_t m_Child = -1;
  int m_Output = -1;
  std::string m_Printed;
};

// A private X server, on a display that it has picked itself. Throws where it does not start.
class VPrivateDisplay : public VBackgroundProgram
{
public:
  VPrivateDisplay();
  const std::string& Name() const { return m_Name; }

private:
  std::string m_Name;
};

}
