#include "Core/VideoInterface/Schemas.h"

namespace KVZ
{

namespace
{

template<class TEnum>
const ISchema* SchemaOf()
{
  static const ISchema* const s_pSchema = []
  {
    const VEnumTable& rTable = GetEnumTable( TEnum{} );
    std::vector<ISchema::VEntry> Entries;
    for( const VEnumRow& rRow : rTable.m_Rows )
    {
      Entries.push_back( { rRow.m_Value, rRow.m_pName, rRow.m_pDescription } );
    }
    return IO::GetUniqueSchema( rTable.m_pSchemaName, rTable.m_pDescription, std::move( Entries ) );
  }();
  return s_pSchema;
}

}

const ISchema* VSchemaOf<IVideoStandard::Enum>::Get() { return SchemaOf<IVideoStandard::Enum>(); }

const ISchema* VSchemaOf<IPixelFormat::Enum>::Get() { return SchemaOf<IPixelFormat::Enum>(); }

const ISchema* VSchemaOf<IInterlacedFormat::Enum>::Get() { return SchemaOf<IInterlacedFormat::Enum>(); }

const ISchema* VSchemaOf<IAudioSampleFormat::Enum>::Get() { return SchemaOf<IAudioSampleFormat::Enum>(); }

const ISchema* VSchemaOf<ITimecodeSource::Enum>::Get() { return SchemaOf<ITimecodeSource::Enum>(); }

const ISchema* VSchemaOf<ITimecodeStandard::Enum>::Get() { return SchemaOf<ITimecodeStandard::Enum>(); }

const ISchema* VSchemaOf<IGenlockStandard::Enum>::Get() { return SchemaOf<IGenlockStandard::Enum>(); }

const ISchema* VSchemaOf<IVideoContainer::Enum>::Get() { return SchemaOf<IVideoContainer::Enum>(); }

const ISchema* VSchemaOf<IVideoPayload::Enum>::Get() { return SchemaOf<IVideoPayload::Enum>(); }

const ISchema* VSchemaOf<IAudioPayload::Enum>::Get() { return SchemaOf<IAudioPayload::Enum>(); }

const ISchema* VSchemaOf<VLensDistortionRecord::ERadialModel>::Get() { return SchemaOf<VLensDistortionRecord::ERadialModel>(); }

}
