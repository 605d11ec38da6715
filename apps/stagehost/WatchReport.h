// What `stagehost watch` shows: a table that is refreshed in place on a terminal, and the final figures as a table or as JSON.
#pragma once

#include "host/FlowGraph.h"
#include "host/FlowGraphWatcher.h"
#include "host/SyncEngine.h"

#include <boost/optional.hpp>

#include <cstddef>
#include <string>
#include <vector>

struct VWatchedDevice
{
  std::string m_URN;
  std::string m_Name;
  std::string m_Standard;   // of the signal; "Unspecified" for none
  StageHost::VWatchFigures m_Figures;
  double m_BufferFill = 0.0;    // 0 to 1
  uint64_t m_CardDropped = 0;   // frames that the card has missed since the watching began
  boost::optional<KVZ::ISourceTemporal::ISourceTimingInfo> m_Timing;
  StageHost::VFlowNodeStatus m_Source;   // of the node that supplies the states
};

class VWatchReport
{
public:
  explicit VWatchReport( bool i_bJson );

  // Draws over the last one. Nothing without a terminal.
  void Refresh( const std::vector<VWatchedDevice>& i_rDevices );
  // The last word, on standard output. False if it could not be written.
  bool Print( const std::vector<VWatchedDevice>& i_rDevices );

private:
  const bool m_bJson;
  const bool m_bTerminal;
  size_t m_Lines = 0;   // drawn, and to be drawn over
};
