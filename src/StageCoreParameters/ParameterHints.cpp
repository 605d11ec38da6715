#include "StageCoreParameters/ParameterHints.h"

using KVZ::ISchema;

namespace
{

// The values count from 0.
const ISchema* MakeSchema( const char* i_pName, const char* i_pDescription, std::initializer_list<const char*> i_Names )
{
  std::vector<ISchema::VEntry> Entries;
  for( const char* pName : i_Names )
  {
    Entries.push_back( { static_cast<int32_t>( Entries.size() ), pName, "" } );
  }
  return KVZ::IO::GetUniqueSchema( i_pName, i_pDescription, std::move( Entries ) );
}

}

const ISchema* KVZ::VSchemaOf<Parameter::PresentationHint::Enum>::Get()
{
  static const ISchema* const s_pSchema = MakeSchema( "Parameter.PresentationHint.Enum", "Presentation hint",
    { "DontCare", "Slider", "MultiLine", "CheckableOption", "CheckableSlider", "Colour" } );
  return s_pSchema;
}

const ISchema* KVZ::VSchemaOf<Parameter::DataConversionHint::Enum>::Get()
{
  static const ISchema* const s_pSchema = MakeSchema( "Parameter.DataConversionHint.Enum", "Data conversion hint",
    { "NoConversion", "SecondsToTick135", "MillisecondsToTick135" } );
  return s_pSchema;
}

const ISchema* KVZ::VSchemaOf<Parameter::FileAccess::Enum>::Get()
{
  static const ISchema* const s_pSchema = MakeSchema( "Parameter.FileAccess.Enum", "File access",
    { "None", "Folder", "Save", "Load", "LoadMultiple" } );
  return s_pSchema;
}
