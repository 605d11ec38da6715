#include "StageCorePluginVideoInput/StageCorePluginVideoInput.h"

#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCorePluginInterface/HardwareRegistry.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCorePluginVideoInput/VideoInputEngine.h"
#include "StageCoreRuntime/DebugServices.h"

using namespace StageCorePluginInterface;

namespace
{

const char* const SectionName = "Video Inputs";
constexpr int SectionSortPosition = 30;

struct VCommandRow
{
  const char* m_pKey;
  const char* m_pText;
  const char* m_pShortcut;
};

// The second speaks of cameras and still belongs to this section.
constexpr VCommandRow Commands[] = {
  { "Devices:SelectAllVideoInputs", "Select All Video Inputs", "Alt+Shift+A" },
  { "Devices:SelectAllCameras", "Select All Cameras", "Ctrl+Shift+A" },
};

}

VStageCorePluginVideoInput::~VStageCorePluginVideoInput() = default;

bool VStageCorePluginVideoInput::Initialise( IStageCoreHost& i_rHost )
{
  m_pEngine.reset( new VVideoInputEngine( i_rHost ) );
  m_pEngine->Start();
  return true;
}

bool VStageCorePluginVideoInput::RegisterFlowNodeFactories( IFlowNodeRegistry& i_rRegistry )
{
  if( !KVZ_ASSERT( m_pEngine != nullptr ) )
  {
    return false;
  }
  i_rRegistry.RegisterFactory( m_pEngine->GetFlowNodeFactory() );
  return true;
}

bool VStageCorePluginVideoInput::RegisterHardware( void*, IHardwareHost& i_rHardware )
{
  if( !KVZ_ASSERT( m_pEngine != nullptr ) )
  {
    return false;
  }
  const std::shared_ptr<IHardwareRegistry> pRegistry = i_rHardware.GetHardwareRegistry();
  pRegistry->RegisterManager( m_pEngine );
  pRegistry->AddSection( SectionName, &SelectVideoInputSection, SectionSortPosition );
  pRegistry->SetSectionRoot( SectionName, DeviceSchemas::VideoInput::Path() );
  for( const VCommandRow& rRow : Commands )
  {
    pRegistry->AddCommand( rRow.m_pKey, { SectionName }, rRow.m_pText, rRow.m_pShortcut );
  }
  return true;
}

bool SelectVideoInputSection( const IDataReader&, const VDataPath& i_rPath ) { return i_rPath.BeginsWith( DeviceSchemas::VideoInput::Path() ); }
