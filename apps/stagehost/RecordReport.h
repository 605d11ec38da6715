// What a recording tells: progress while it runs, and the account at its end.
#pragma once

#include "apps/stagehost/RecordLimits.h"
#include "host/DeviceSettings.h"
#include "host/Recording.h"

#include <string>
#include <vector>

struct VReportOptions
{
  bool m_bJson = false;
  bool m_bProgressBlocks = false;
};

class VRecordReport
{
public:
  VRecordReport( const VReportOptions& i_rOptions, const std::vector<StageHost::VDeviceInfo>& i_rDevices, std::vector<VLimitNotice> i_Limits );

  // On standard error: blocks where they were asked for, else one line rewritten in place on a terminal, else nothing. Before a container is full, a
  // line that says so.
  void ShowProgress( const std::vector<StageHost::VDeviceOutcome>& i_rOutcomes, double i_Now );
  void EndProgress();

  // On standard output. False where that cannot be written.
  bool Print( const std::vector<StageHost::VDeviceOutcome>& i_rOutcomes ) const;

private:
  void PrintText( const StageHost::VDeviceOutcome& i_rOutcome ) const;
  void WarnOfLimits( const std::vector<StageHost::VDeviceOutcome>& i_rOutcomes );
  std::string NameOf( const std::string& i_rURN ) const;
  const VLimitNotice* LimitOf( const std::string& i_rURN ) const;

  const VReportOptions m_Options;
  const std::vector<StageHost::VDeviceInfo> m_Devices;
  std::vector<VLimitNotice> m_Limits;
  const bool m_bTerminal;
  double m_NextProgress = 0.0;
  bool m_bLineOpen = false;
};
