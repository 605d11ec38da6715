#include "Flow2/Flow2Utils/ParameterUtilsChecked.h"

#include "Flow2/Flow2Utils/FlowException.h"
#include "StageCorePluginInterface/FlowNode.h"
#include "StageCoreRuntime/GlobalLog.h"

namespace Flow2Utils
{

namespace
{

struct VUpdate
{
  VParameterSet& m_rSet;
  uint32_t m_Flags;
  uint32_t m_Result = 0;
  std::string m_Errors{};
};

void Apply( VUpdate& io_rUpdate, const KVZ::VFlowParameterTexts& i_rTexts )
{
  for( const auto& rEntry : i_rTexts )
  {
    const uint32_t Result = io_rUpdate.m_rSet.SetParameter( rEntry.first, rEntry.second );
    if( Result == EParameterResult::UnknownName && ( io_rUpdate.m_Flags & EParameterFlags::UnknownIsError ) != 0 )
    {
      io_rUpdate.m_Errors += "Unknown parameter " + rEntry.first + "\n";
      io_rUpdate.m_Result = EParameterResult::Failed;
    }
    else if( Result == EParameterResult::BadText )
    {
      io_rUpdate.m_Errors += "Could not parse parameter " + rEntry.first + "\n";
      io_rUpdate.m_Result = EParameterResult::Failed;
    }
  }
}

void Begin( VUpdate& io_rUpdate )
{
  if( ( io_rUpdate.m_Flags & EParameterFlags::BeginUpdate ) != 0 )
  {
    io_rUpdate.m_rSet.BeginUpdate();
  }
}

void Take( VUpdate& io_rUpdate, const VParameterInput& i_rInput )
{
  i_rInput.ForEach( io_rUpdate.m_rSet, [&io_rUpdate]( const KVZ::VFlowParameterTexts& i_rTexts ) { Apply( io_rUpdate, i_rTexts ); } );
}

[[noreturn]] void Throw( const std::string& i_rText )
{
  KVZ::ILogCategorised& rLog = KVZ::GlobalLog();
  const KVZ::VLogCategory& rCategory = rLog.Category( "Internal" );
  if( rCategory.IsAllowed( KVZ::LogLevel::Error ) )
  {
    rLog.Write( rCategory, KVZ::LogLevel::Error, "Flow2Utils/ParameterUtilsChecked", __LINE__, i_rText );
  }
  throw VFlowException( i_rText );
}

bool End( VUpdate& io_rUpdate )
{
  if( ( io_rUpdate.m_Flags & EParameterFlags::EndUpdate ) != 0 )
  {
    io_rUpdate.m_rSet.EndUpdate();
  }
  if( KVZ::IsFlowFailure( io_rUpdate.m_Result ) )
  {
    Throw( io_rUpdate.m_Errors );
  }
  return io_rUpdate.m_rSet.HasChanged();
}

}

const KVZ::VFlowParameters* VParameterInput::AsParameters( const KVZ::VFlowItemPtr& i_pItem )
{
  const bool bParameters = i_pItem && &i_pItem->Type() == &KVZ::VFlowParameters::ItemType;
  return bParameters ? static_cast<const KVZ::VFlowParameters*>( i_pItem.get() ) : nullptr;
}

bool UpdateChecked( VParameterSet& io_rSet, const VParameterInput& i_rInput, uint32_t i_Flags )
{
  VUpdate Update{ io_rSet, i_Flags };
  Begin( Update );
  Take( Update, i_rInput );
  return End( Update );
}

bool UpdateChecked( VParameterSet& io_rSet, const VParameterInput& i_rFirst, const VParameterInput& i_rSecond, uint32_t i_Flags )
{
  VUpdate Update{ io_rSet, i_Flags };
  Begin( Update );
  Take( Update, i_rFirst );
  Take( Update, i_rSecond );
  return End( Update );
}

void ValidateChecked( const VParameterSet& i_rSet )
{
  std::string Text;
  if( !i_rSet.Validate( Text ) )
  {
    Throw( Text );
  }
}

}
