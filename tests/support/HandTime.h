// A host's time that passes when a test says so.
#pragma once

#include "StageCorePluginInterface/StageCoreHost.h"

namespace TestSupport
{

class VHandTime : public StageCorePluginInterface::ITimeService
{
public:
  double Now() override { return m_Now; }
  double m_Now = 0.0;   // in seconds
};

}
