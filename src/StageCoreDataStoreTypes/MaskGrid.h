// The mask that a user has drawn over a device's image, as tiles that are masked or not, schema "MaskGrid".
#pragma once

#include "StageCoreRuntime/Variant.h"

struct VMaskGrid
{
  std::string m_DeviceURN;
  uint32_t m_TileSizeX = 0;   // pixels
  uint32_t m_TileSizeY = 0;
  uint32_t m_GridSizeX = 0;   // tiles
  uint32_t m_GridSizeY = 0;
  std::vector<uint32_t> m_RunLengths;   // row by row, unmasked and masked in turn; empty for no mask

  bool operator==( const VMaskGrid& ) const = default;
};

template<>
struct KVZ::VSchemaOf<VMaskGrid>
{
  static const ISchema* Get();

  template<class TRecord, class TVisitor>
  static void Visit( TRecord& i_rRecord, TVisitor& i_rVisitor )
  {
    i_rVisitor( i_rRecord.m_DeviceURN );
    i_rVisitor( i_rRecord.m_TileSizeX );
    i_rVisitor( i_rRecord.m_TileSizeY );
    i_rVisitor( i_rRecord.m_GridSizeX );
    i_rVisitor( i_rRecord.m_GridSizeY );
    i_rVisitor( i_rRecord.m_RunLengths );
  }
};
