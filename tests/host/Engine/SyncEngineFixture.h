// A sync engine whose strand and delays run when a test says so, and sources that are moved by hand.
#pragma once

#include "host/SyncEngine.h"
#include "tests/support/FakeSource.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

constexpr int64_t Period25 = 5400000;
constexpr int64_t Period5994 = 2252250;
inline const KVZ::VTick OneHour = KVZ::SecondsToTick135( 3600 );

// Every wait ends when a test says so.
class VManualDelays : public StageHost::IDelayedCalls, public TestSupport::VManualPostalService
{
public:
  void CallAfter( double, std::function<void()> i_Function ) override { Post( std::move( i_Function ) ); }
};

class VSyncEngineFixture : public testing::Test
{
protected:
  std::shared_ptr<TestSupport::VFakeSource> Add( const std::string& i_rName, int64_t i_Period )
  {
    auto pSource = std::make_shared<TestSupport::VFakeSource>( i_rName, i_Period );
    m_pEngine->AddSource( pSource );
    return pSource;
  }

  // A source in its first session.
  std::shared_ptr<TestSupport::VFakeSource> AddRunning( const std::string& i_rName, int64_t i_Period, KVZ::VTick i_Timecode, uint64_t i_Newest )
  {
    auto pSource = Add( i_rName, i_Period );
    pSource->BeginSession( 100.0, i_Timecode );
    pSource->SetNewest( i_Newest );
    return pSource;
  }

  const std::shared_ptr<TestSupport::VManualPostalService> m_pStrand = std::make_shared<TestSupport::VManualPostalService>();
  const std::shared_ptr<VManualDelays> m_pDelays = std::make_shared<VManualDelays>();
  const std::shared_ptr<StageHost::VSyncEngine> m_pEngine = std::make_shared<StageHost::VSyncEngine>( m_pStrand, m_pDelays );
};
