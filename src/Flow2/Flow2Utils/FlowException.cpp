#include "Flow2/Flow2Utils/FlowException.h"

namespace Flow2Utils
{

VFlowException::VFlowException( const std::string& i_rText, int i_LogLevel, int i_Code )
  : std::runtime_error( i_rText ), m_LogLevel( i_LogLevel ), m_Code( i_Code )
{
}

VFlowException::~VFlowException() = default;
VFlowFinishedException::~VFlowFinishedException() = default;

}
