// Updates of a parameter set from what a node is given: texts by name, items that carry such texts, or two of these one after another.
//
// All forms end in VFlowException, with a line in the log for the whole of it, where something could not be applied; the rest was applied.
#pragma once

#include "Flow2/Flow2Utils/ParameterSet.h"

#include <cstdint>

namespace Flow2Utils
{

// One source of texts. Does not own what it was made of.
class VParameterInput
{
public:
  VParameterInput( const KVZ::VFlowParameterTexts& i_rTexts ) : m_pTexts( &i_rTexts ) {}
  // Items of other types are passed over, and parameters that are addressed to somebody else.
  VParameterInput( const KVZ::VFlowItemList& i_rItems ) : m_pItems( &i_rItems ) {}

  // Calls the function with each set of texts that is meant for the set.
  template<class TFunction>
  void ForEach( const VParameterSet& i_rSet, TFunction i_Function ) const
  {
    if( m_pTexts )
    {
      i_Function( *m_pTexts );
      return;
    }
    for( const KVZ::VFlowItemPtr& pItem : *m_pItems )
    {
      const auto* pParameters = AsParameters( pItem );
      if( pParameters && i_rSet.IsAddressed( pParameters->m_Target ) )
      {
        i_Function( pParameters->m_Texts );
      }
    }
  }

private:
  static const KVZ::VFlowParameters* AsParameters( const KVZ::VFlowItemPtr& i_pItem );

  const KVZ::VFlowParameterTexts* m_pTexts = nullptr;
  const KVZ::VFlowItemList* m_pItems = nullptr;
};

// Flags are EParameterFlags. True where the set has changed since the update's beginning.
bool UpdateChecked( VParameterSet& io_rSet, const VParameterInput& i_rInput, uint32_t i_Flags );
// One update of both, the second over the first.
bool UpdateChecked( VParameterSet& io_rSet, const VParameterInput& i_rFirst, const VParameterInput& i_rSecond, uint32_t i_Flags );
// All parameters are valid, or an exception that lists those that are not.
void ValidateChecked( const VParameterSet& i_rSet );

}
