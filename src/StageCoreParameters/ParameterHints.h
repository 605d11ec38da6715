// How a settings view shall show and convert a parameter. Schemas "Parameter.PresentationHint.Enum" and so on.
#pragma once

#include "StageCoreRuntime/Variant.h"

namespace Parameter
{

class PresentationHint
{
public:
  enum Enum : int32_t
  {
    EDontCare = 0,
    ESlider = 1,
    EMultiLine = 2,
    ECheckableOption = 3,
    ECheckableSlider = 4,
    EColour = 5
  };
};

// What the number that a person types is, where the value itself is in ticks of 135 MHz.
class DataConversionHint
{
public:
  enum Enum : int32_t
  {
    ENoConversion = 0,
    ESecondsToTick135 = 1,
    EMillisecondsToTick135 = 2
  };
};

// What the text names, where it is the name of a file or folder.
class FileAccess
{
public:
  enum Enum : int32_t
  {
    ENone = 0,
    EFolder = 1,
    ESave = 2,
    ELoad = 3,
    ELoadMultiple = 4
  };
};

}

template<>
struct KVZ::VSchemaOf<Parameter::PresentationHint::Enum>
{
  static const ISchema* Get();
};

template<>
struct KVZ::VSchemaOf<Parameter::DataConversionHint::Enum>
{
  static const ISchema* Get();
};

template<>
struct KVZ::VSchemaOf<Parameter::FileAccess::Enum>
{
  static const ISchema* Get();
};
