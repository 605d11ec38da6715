// The host's side of settings, moved by hand: which folders captures may go to, which clock is the master.
#pragma once

#include "StageCorePluginInterface/StageCoreHost.h"

#include <memory>
#include <string>
#include <vector>

namespace TestSupport
{

class VFakeCaptureTargets : public StageCorePluginInterface::ICaptureTargets
{
public:
  void GetFolderAliases( std::vector<std::string>& o_rAliases ) override { o_rAliases = m_Aliases; }
  KVZ::IMultiCallbackPostal<void()>& GetFolderAliasesChangedCallback() override { return m_Changed; }
  std::vector<int32_t> GetContainers( const std::string& ) override { return {}; }
  bool GetTarget( const KVZ::ICaptureHeader&, const std::string&, int32_t, StageCorePluginInterface::VCaptureTarget& ) override { return false; }

  void SetAliases( std::vector<std::string> i_Aliases )
  {
    m_Aliases = std::move( i_Aliases );
    m_Changed();
  }

private:
  std::vector<std::string> m_Aliases = { "Default", "Fast Disk" };
  NotificationSystem::VMultiCallbackPostal<void()> m_Changed;
};

class VFakeMasterClock : public KVZ::IBaseLineClock
{
public:
  explicit VFakeMasterClock( KVZ::VTick i_Period ) : m_Period( i_Period ) {}
  std::string GetName() const override { return "Master"; }
  KVZ::VTick GetPeriod() const override { return m_Period; }

private:
  const KVZ::VTick m_Period;
};

// Without a master clock until its period is set.
class VFakeSourceRegistry : public StageCorePluginInterface::ISourceRegistry
{
public:
  void AddSource( std::shared_ptr<KVZ::ISource> ) override {}
  void RemoveSource( const std::shared_ptr<KVZ::ISource>& ) override {}
  std::shared_ptr<KVZ::IBaseLineClock> GetMasterClock() override { return m_pClock; }
  KVZ::IMultiCallbackPostal<void()>& GetMasterPeriodChangedCallback() override { return m_PeriodChanged; }

  void SetMasterPeriod( KVZ::VTick i_Period )
  {
    m_pClock = std::make_shared<VFakeMasterClock>( i_Period );
    m_PeriodChanged();
  }

private:
  std::shared_ptr<KVZ::IBaseLineClock> m_pClock;
  NotificationSystem::VMultiCallbackPostal<void()> m_PeriodChanged;
};

}
