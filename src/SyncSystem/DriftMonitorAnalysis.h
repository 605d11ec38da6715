// Publishes, for diagnosis, how late samples were delivered: one flow state a sample, with one item of named values.
#pragma once

#include "Core/VideoInterface/FlowState.h"

#include <functional>

namespace SyncSystem
{

struct VDeliveryOffsets
{
  double m_Delivery = 0.0;    // later than the fit says, seconds
  double m_Predicted = 0.0;   // the mean of the recent ones: what was to be expected
};

// As "DeliveryOffset" and "PredictedOffset".
void AddOffsets( KVZ::VFlowGenericData& io_rData, const VDeliveryOffsets& i_rOffsets );

// Used on the delivery thread alone, without a lock held.
class VDriftMonitorAnalysis
{
public:
  using VStateFactory = std::function<KVZ::VFlowStatePtr()>;   // an empty pointer: the sample is passed over
  using VSink = std::function<void( KVZ::VFlowStatePtr )>;

  VDriftMonitorAnalysis( VStateFactory i_MakeState, VSink i_Sink ) : m_MakeState( std::move( i_MakeState ) ), m_Sink( std::move( i_Sink ) ) {}

  void Publish( const VDeliveryOffsets& i_rOffsets );

private:
  const VStateFactory m_MakeState;
  const VSink m_Sink;
};

}
