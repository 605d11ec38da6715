// A device's handler between a real data store and fakes of everything else; reactions run when a test says so.
#pragma once

#include "StageCoreDataStore/DataVerifyWriter.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCoreParameters/Parameter.h"
#include "host/DataStore.h"
#include "host/Registries.h"
#include "tests/support/FakeSettingsHost.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

namespace TestSupport
{

template<class THandler>
class VParameterHandlerFixture : public testing::Test
{
protected:
  // As another part of the program does.
  template<class T>
  void Save( const VDataPath& i_rPath, const T& i_rValue )
  {
    VDataWriter( *m_pStore ).SetValue( i_rPath, KVZ::Variant::Make( i_rValue ) );
    m_pService->RunAll();
  }

  // The user's write.
  template<class T>
  bool Set( const std::string& i_rKey, const T& i_rValue )
  {
    const bool bSet = m_pHandler->GetParameter( i_rKey )->SetValue( KVZ::Variant::Make( i_rValue ) );
    m_pService->RunAll();
    return bSet;
  }

  template<class T>
  T Value( const std::string& i_rKey )
  {
    KVZ::Variant Value;
    T Result{};
    m_pHandler->GetParameter( i_rKey )->GetValue( Value );
    EXPECT_TRUE( Value.Get( Result ) ) << i_rKey << " is " << Value.ToText();
    return Result;
  }

  std::vector<std::string> LabelsOf( const std::string& i_rKey )
  {
    std::vector<std::string> Labels;
    m_pHandler->GetParameter( i_rKey )->GetEnum( Labels );
    return Labels;
  }

  const std::shared_ptr<VManualPostalService> m_pService = std::make_shared<VManualPostalService>();
  const std::shared_ptr<StageHost::VDataStore> m_pStore = std::make_shared<StageHost::VDataStore>();
  const std::shared_ptr<StageHost::VParameterRegistry> m_pRegistry = std::make_shared<StageHost::VParameterRegistry>();
  const VDataPath m_Device = DeviceSchemas::VideoInput::Path( "vi:0" );
  std::shared_ptr<THandler> m_pHandler;
};

}
