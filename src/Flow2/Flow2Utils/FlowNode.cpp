#include "Flow2/Flow2Utils/FlowNode.h"

#include "Flow2/Flow2Utils/FlowException.h"
#include "StageCoreRuntime/GlobalLog.h"

namespace Flow2Utils
{

namespace
{

uint32_t Finish( const char* i_pOperation, const VFlowFinishedException& i_rReason )
{
  KVZ_LOG( "Flow2Utils", 5, "Node exited in %1% - %2%", i_pOperation, i_rReason.what() );
  return KVZ::EFlowResult::Stopping;
}

}

VFlowNodeBase::~VFlowNodeBase() = default;

uint32_t VFlowNodeBase::PreProcessChecked( std::shared_ptr<KVZ::IFlowNodeServices> i_pServices )
{
  InstallServices( std::move( i_pServices ) );
  try
  {
    OnServicesInstalled();
    return PreProcess();
  }
  catch( const VFlowFinishedException& rReason )
  {
    return Finish( "PreProcess", rReason );
  }
}

uint32_t VFlowNodeBase::ProcessChecked()
{
  try
  {
    Process();
    return KVZ::EFlowResult::Ok;
  }
  catch( const VFlowFinishedException& rReason )
  {
    return Finish( "Process", rReason );
  }
}

uint32_t VFlowNodeBase::PostProcessChecked()
{
  uint32_t Result = KVZ::EFlowResult::Ok;
  try
  {
    PostProcess();
  }
  catch( const VFlowFinishedException& rReason )
  {
    Result = Finish( "PostProcess", rReason );
  }
  catch( ... )
  {
    UninstallServices();
    throw;
  }
  UninstallServices();
  return Result;
}

}
