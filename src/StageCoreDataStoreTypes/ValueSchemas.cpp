#include "StageCoreDataStoreTypes/GreyscaleMode.h"
#include "StageCoreDataStoreTypes/MaskGrid.h"

const KVZ::ISchema* KVZ::VSchemaOf<CoreTarvoTypesUtils::EGreyscaleMode::Enum>::Get()
{
  using CoreTarvoTypesUtils::EGreyscaleMode;
  static const ISchema* const s_pSchema = IO::GetUniqueSchema( "CoreTarvoTypesUtils.EGreyscaleMode", "Greyscale mode",
    std::vector<ISchema::VEntry>{
      { EGreyscaleMode::EAuto, "Auto", "" },
      { EGreyscaleMode::ENone, "None", "" },
      { EGreyscaleMode::EOnly, "Only", "" },
      { EGreyscaleMode::EEdges, "Edges", "" },
      { EGreyscaleMode::ENoEdges, "NoEdges", "" },
    } );
  return s_pSchema;
}

const KVZ::ISchema* KVZ::VSchemaOf<VMaskGrid>::Get()
{
  static const ISchema* const s_pSchema = IO::GetUniqueSchema( "MaskGrid", "Masked tiles of a device's image",
    std::vector<ISchema::VField>{
      { "DeviceURN", VSchemaOf<std::string>::Get() },
      { "TileSizeX", VSchemaOf<uint32_t>::Get() },
      { "TileSizeY", VSchemaOf<uint32_t>::Get() },
      { "GridSizeX", VSchemaOf<uint32_t>::Get() },
      { "GridSizeY", VSchemaOf<uint32_t>::Get() },
      { "RunLengths", VSchemaOf<std::vector<uint32_t>>::Get() },
    } );
  return s_pSchema;
}
