// How a camera delivers grey values, schema "CoreTarvoTypesUtils.EGreyscaleMode".
#pragma once

#include "StageCoreRuntime/Variant.h"

namespace CoreTarvoTypesUtils
{

class EGreyscaleMode
{
public:
  enum Enum : int32_t
  {
    EAuto = 0,
    ENone = 1,
    EOnly = 2,
    EEdges = 3,
    ENoEdges = 4
  };
};

}

template<>
struct KVZ::VSchemaOf<CoreTarvoTypesUtils::EGreyscaleMode::Enum>
{
  static const ISchema* Get();
};
