#include "StageCoreParameters/StageCoreParameterHandler.h"

#include "StageCoreDataStore/DataWriter.h"
#include "StageCoreRuntime/DebugServices.h"

VStageCoreParameterHandler::VStageCoreParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService,
  std::shared_ptr<IDataStore> i_pDataStore, std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry,
  const VDataPath& i_rPath, const VDataPath& i_rAttributePath )
  : m_pPostalService( std::move( i_pPostalService ) ),
    m_pDataStore( std::move( i_pDataStore ) ),
    m_pParameterRegistry( std::move( i_pParameterRegistry ) ),
    m_pParameterGroup( std::make_shared<VParameterGroup>( m_pDataStore, i_rPath, i_rAttributePath ) )
{
}

// The registry hears of the group once its parameters can be read.
void VStageCoreParameterHandler::PostConstruct()
{
  {
    const VDataWriter Writer( *m_pDataStore );
    CreateParameters();
  }
  m_pParameterRegistry->AddParameterGroup( m_pParameterGroup );
}

void VStageCoreParameterHandler::PreDestruct() { m_pParameterRegistry->RemoveParameterGroup( m_pParameterGroup ); }

std::shared_ptr<VParameter> VStageCoreParameterHandler::GetParameter( const std::string& i_rKey ) const
{
  std::shared_ptr<VParameter> pParameter = std::dynamic_pointer_cast<VParameter>( m_pParameterGroup->GetParameter( i_rKey ) );
  KVZ_ASSERT( pParameter );
  return pParameter;
}

VParameter& VStageCoreParameterHandler::AddParameterOf( std::shared_ptr<const VParameterChecker> i_pChecker, const VDataPath& i_rPath,
  const VParameterText& i_rText, uint32_t i_Traits )
{
  const auto pParameter = KVZ::MakeShared<VParameter>( m_pDataStore, std::move( i_pChecker ), i_rPath.Parent(), i_rPath.Name() );
  KVZ_ASSERT( m_pParameterGroup->AddParameter( pParameter ) );
  pParameter->SetCategory( i_rText.m_pCategory );
  pParameter->SetDisplay( i_rText.m_pDisplay );
  pParameter->SetDescription( i_rText.m_pDescription );
  pParameter->SetHidden( ( i_Traits & ParameterTraits::Hidden ) != 0 );
  pParameter->SetAdvanced( ( i_Traits & ParameterTraits::Advanced ) != 0 );
  pParameter->SetReadOnly( ( i_Traits & ParameterTraits::ReadOnly ) != 0 );
  const bool bVerify = ( i_Traits & ParameterTraits::VerifyRequired ) != 0;
  if( pParameter->IsVerifyRequired() != bVerify )
  {
    pParameter->SetVerifyRequired( bVerify );
  }
  return *pParameter;
}

bool VStageCoreParameterHandler::PublishVariant( const std::string& i_rKey, const KVZ::Variant& i_rValue ) const
{
  const std::shared_ptr<VParameter> pParameter = GetParameter( i_rKey );
  return pParameter && pParameter->SetValueInternal( i_rValue );
}

bool VStageCoreParameterHandler::OfferChoices( const std::string& i_rKey, const VParameterChoices& i_rChoices ) const
{
  const std::shared_ptr<VParameter> pParameter = GetParameter( i_rKey );
  return pParameter && !i_rChoices.empty() && pParameter->SetEnum( i_rChoices );
}

bool VStageCoreParameterHandler::OfferChoicesAndCorrect( const std::string& i_rKey, const VParameterChoices& i_rChoices,
  const KVZ::Variant& i_rFallback ) const
{
  const std::shared_ptr<VParameter> pParameter = GetParameter( i_rKey );
  if( !pParameter || i_rChoices.empty() )
  {
    return false;
  }
  pParameter->SetEnum( i_rChoices );
  KVZ::Variant Value;
  const auto IsValue = [&Value]( const KVZ::VLabelledVariant& i_rChoice ) { return i_rChoice.m_Value == Value; };
  if( !pParameter->GetValue( Value ) || std::none_of( i_rChoices.begin(), i_rChoices.end(), IsValue ) )
  {
    pParameter->SetValueInternal( i_rFallback.IsEmpty() ? i_rChoices.front().m_Value : i_rFallback );
  }
  return true;
}
