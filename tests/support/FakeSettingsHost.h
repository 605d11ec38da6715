// The host's side of settings, moved by hand: where groups are registered, which folders captures may go to, which clock is the master.
#pragma once

#include "StageCoreParameters/ParameterGroup.h"
#include "StageCorePluginInterface/StageCoreHost.h"

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

namespace TestSupport
{

class VFakeParameterRegistry : public StageCorePluginInterface::IParameterRegistry
{
public:
  void AddParameterGroup( std::shared_ptr<IParameterGroup> i_pGroup ) override { m_Groups.push_back( std::move( i_pGroup ) ); }
  void RemoveParameterGroup( const std::shared_ptr<IParameterGroup>& i_pGroup ) override
  {
    m_Groups.erase( std::remove( m_Groups.begin(), m_Groups.end(), i_pGroup ), m_Groups.end() );
  }

  std::vector<std::shared_ptr<IParameterGroup>> m_Groups;
};

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

class VFakeSourceRegistry : public StageCorePluginInterface::ISourceRegistry
{
public:
  void AddSource( std::shared_ptr<KVZ::ISource> i_pSource ) override { m_Sources.push_back( std::move( i_pSource ) ); }
  void RemoveSource( const std::shared_ptr<KVZ::ISource>& i_pSource ) override
  {
    m_Sources.erase( std::remove( m_Sources.begin(), m_Sources.end(), i_pSource ), m_Sources.end() );
  }
  std::shared_ptr<KVZ::IBaseLineClock> GetMasterClock() override { return m_pClock; }
  KVZ::IMultiCallbackPostal<void()>& GetMasterPeriodChangedCallback() override { return m_PeriodChanged; }

  void SetMasterPeriod( KVZ::VTick i_Period )
  {
    m_pClock = std::make_shared<VFakeMasterClock>( i_Period );
    m_PeriodChanged();
  }

  std::vector<std::shared_ptr<KVZ::ISource>> m_Sources;

private:
  std::shared_ptr<KVZ::IBaseLineClock> m_pClock;
  NotificationSystem::VMultiCallbackPostal<void()> m_PeriodChanged;
};

}
