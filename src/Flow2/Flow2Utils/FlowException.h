// What the flow wrappers throw. Defined in the runtime library alone, so that module and host catch each other's.
#pragma once

#include <stdexcept>
#include <string>

namespace Flow2Utils
{

// Leaves a node and ends the graph's run with its text.
class __attribute__( ( visibility( "default" ) ) ) VFlowException : public std::runtime_error
{
public:
  explicit VFlowException( const std::string& i_rText, int i_LogLevel = 2, int i_Code = 1 );
  VFlowException( const VFlowException& ) = default;
  VFlowException& operator=( const VFlowException& ) = default;
  ~VFlowException() override;

  int LogLevel() const { return m_LogLevel; }
  int Code() const { return m_Code; }

private:
  int m_LogLevel;
  int m_Code;
};

// A stop, or the end of data: ends its node without error.
class __attribute__( ( visibility( "default" ) ) ) VFlowFinishedException : public VFlowException
{
public:
  using VFlowException::VFlowException;
  VFlowFinishedException( const VFlowFinishedException& ) = default;
  VFlowFinishedException& operator=( const VFlowFinishedException& ) = default;
  ~VFlowFinishedException() override;
};

}
