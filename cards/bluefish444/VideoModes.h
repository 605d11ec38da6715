// The vendor's video modes and memory formats, and the sizes that follow from them.
#pragma once

#include "Core/VideoInterface/PixelFormat.h"
#include "Core/VideoInterface/VideoStandard.h"

#include <cstdint>

namespace VirtualCards
{

// What this generation of the driver gives for "no signal".
constexpr uint32_t NoSignalMode = 46;

// NoSignalMode for a standard that this kind of card does not carry.
uint32_t ModeOf( KVZ::IVideoStandard::Enum i_Standard );
// A null pointer for a mode that the card does not have.
const KVZ::VVideoStandardRow* StandardOf( uint32_t i_Mode );

// "Unspecified" for a memory format that virtual cards do not deliver.
KVZ::IPixelFormat::Enum PixelFormatOf( uint32_t i_MemoryFormat );

// All zero for what the card does not know.
struct VModeSizes
{
  uint32_t m_Width = 0;
  uint32_t m_Lines = 0;
  uint32_t m_LineBytes = 0;
  uint32_t m_Bytes = 0;
  uint32_t m_GoldenBytes = 0;   // m_Bytes rounded up to whole pages
};
VModeSizes SizesOf( uint32_t i_Mode, uint32_t i_MemoryFormat, uint32_t i_UpdateMethod );

}
