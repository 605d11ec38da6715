// The value of a parameter, and its events.
#include "StageCoreParameters/Parameter.h"

#include "StageCoreDataStore/DataVerifyWriter.h"

namespace
{

// Stands in where the store has refused the lock.
class VNowhere : public IDataNode
{
public:
  VEvent& OnProposedValue() override { return m_Event; }
  VEvent& OnValueChanged() override { return m_Event; }
  VEvent& OnValueAdded() override { return m_Event; }
  VEvent& OnValueRemoved() override { return m_Event; }
  VEvent& OnFlagsChanged() override { return m_Event; }
  VEvent& OnBranchChanged() override { return m_Event; }

private:
  NotificationSystem::VMultiCallbackPostal<void()> m_Event;
};

IDataNode& NodeOrNowhere( IDataNode* i_pNode )
{
  static VNowhere s_Nowhere;
  return i_pNode ? *i_pNode : s_Nowhere;
}

std::function<void()> Subscribe( IParameter::VEvent& i_rEvent, std::function<void()> i_Function, std::shared_ptr<KVZ::IPostalService> i_pService )
{
  void* pHandle = i_rEvent.Add( std::move( i_Function ), std::move( i_pService ) );
  return [&i_rEvent, pHandle] { i_rEvent.Remove( pHandle ); };
}

}

VParameter::~VParameter()
{
  for( const auto* pEnds : { &m_ProposedValueEnds, &m_ValueChangedEnds } )
  {
    for( const std::function<void()>& rEnd : *pEnds )
    {
      rEnd();
    }
  }
}

bool VParameter::HasFlag( uint32_t i_Flag ) const
{
  uint32_t Flags = 0;
  return VDataReader( *m_pDataStore ).GetValueFlags( m_Value, Flags ) && ( Flags & i_Flag ) != 0;
}

bool VParameter::SetFlag( uint32_t i_Flag, bool i_bSet )
{
  VDataWriter Writer( *m_pDataStore );
  uint32_t Flags = 0;
  Writer.GetValueFlags( m_Value, Flags );
  return Writer.SetValueFlags( m_Value, i_bSet ? Flags | i_Flag : Flags & ~i_Flag );
}

bool VParameter::IsReadOnly() const { return HasFlag( DataFlags::ReadOnly ); }

bool VParameter::IsVerifyRequired() const { return HasFlag( DataFlags::VerifyRequired ); }

bool VParameter::IsNotSerialized() const { return HasFlag( DataFlags::NotSerialized ); }

bool VParameter::SetReadOnly( bool i_bReadOnly ) { return SetFlag( DataFlags::ReadOnly, i_bReadOnly ); }

bool VParameter::SetNotSerialized( bool i_bNotSerialized ) { return SetFlag( DataFlags::NotSerialized, i_bNotSerialized ); }

bool VParameter::GetProposedValue( KVZ::Variant& o_rValue ) const { return VDataVerifyReader( *m_pDataStore ).GetProposedValue( m_Value, o_rValue ); }

bool VParameter::GetVerifiedValue( KVZ::Variant& o_rValue ) const { return VDataVerifyReader( *m_pDataStore ).GetVerifiedValue( m_Value, o_rValue ); }

bool VParameter::GetValue( KVZ::Variant& o_rValue ) const { return VDataReader( *m_pDataStore ).GetValue( m_Value, o_rValue ); }

bool VParameter::HasValue() const { return VDataReader( *m_pDataStore ).Exists( m_Value ); }

bool VParameter::IsWithinLimits( const IDataReader& i_rReader, const KVZ::Variant& i_rValue ) const
{
  KVZ::Variant Limit;
  if( i_rReader.GetValue( m_Attributes[Min], Limit ) && !m_pChecker->IsLessOrEqual( Limit, i_rValue ) )
  {
    return false;
  }
  if( i_rReader.GetValue( m_Attributes[Max], Limit ) && !m_pChecker->IsLessOrEqual( i_rValue, Limit ) )
  {
    return false;
  }
  VParameterChoices Choices;
  return !KVZ::GetLabelledList( i_rReader.GetValue( m_Attributes[Enum] ), Choices ) || m_pChecker->IsAllowed( Choices, i_rValue );
}

bool VParameter::SetValue( const KVZ::Variant& i_rValue )
{
  if( !Fits( i_rValue ) )
  {
    return false;
  }
  VDataWriter Writer( *m_pDataStore );
  uint32_t Flags = 0;
  if( Writer.GetValueFlags( m_Value, Flags ) && ( Flags & DataFlags::ReadOnly ) != 0 )
  {
    return false;
  }
  return IsWithinLimits( Writer, i_rValue ) && Writer.SetValue( m_Value, i_rValue );
}

bool VParameter::SetValueInternal( const KVZ::Variant& i_rValue )
{
  return Fits( i_rValue ) && VDataWriter( *m_pDataStore ).SetValue( m_Value, i_rValue );
}

bool VParameter::SetVerifiedValue( const KVZ::Variant& i_rValue )
{
  return Fits( i_rValue ) && VDataVerifyWriter( *m_pDataStore ).SetVerifiedValue( m_Value, i_rValue );
}

bool VParameter::RemoveValue() { return VDataWriter( *m_pDataStore ).RemoveValue( m_Value ); }

bool VParameter::RemoveAll()
{
  VDataWriter Writer( *m_pDataStore );
  bool bRemoved = Writer.RemoveValue( m_Value );
  uint32_t Flags = 0;
  if( Writer.GetValueFlags( m_Value, Flags ) )
  {
    bRemoved = Writer.SetValueFlags( m_Value, 0 ) || bRemoved;
  }
  for( const VDataPathHandle& rAttribute : m_Attributes )
  {
    bRemoved = Writer.RemoveValue( rAttribute ) || bRemoved;
  }
  return bRemoved;
}

IDataNode& VParameter::Node( const VDataPathHandle& i_rHandle ) { return NodeOrNowhere( VDataWriter( *m_pDataStore ).GetNode( i_rHandle ) ); }

IParameter::VEvent& VParameter::GetAttributesChangedCallback()
{
  return NodeOrNowhere( VDataWriter( *m_pDataStore ).GetNode( m_AttributeRoot + "*" ) ).OnBranchChanged();
}

IParameter::VEvent& VParameter::GetThirdNodeCallback() { return Node( m_Value ).OnValueAdded(); }

IParameter::VEvent& VParameter::GetProposedValueCallback() { return Node( m_Value ).OnProposedValue(); }

IParameter::VEvent& VParameter::GetValueChangedCallback() { return Node( m_Value ).OnValueChanged(); }

IParameter::VEvent& VParameter::GetFifthNodeCallback() { return Node( m_Value ).OnFlagsChanged(); }

IParameter::VEvent& VParameter::GetFourthNodeCallback() { return Node( m_Value ).OnValueRemoved(); }

IParameter::VEvent& VParameter::GetHiddenChangedCallback() { return Node( m_Attributes[Hidden] ).OnBranchChanged(); }

void VParameter::SubscribeProposedValue( std::function<void()> i_Function, std::shared_ptr<KVZ::IPostalService> i_pService )
{
  m_ProposedValueEnds.push_back( Subscribe( GetProposedValueCallback(), std::move( i_Function ), std::move( i_pService ) ) );
}

void VParameter::SubscribeValueChanged( std::function<void()> i_Function, std::shared_ptr<KVZ::IPostalService> i_pService )
{
  m_ValueChangedEnds.push_back( Subscribe( GetValueChangedCallback(), std::move( i_Function ), std::move( i_pService ) ) );
}
