// The item types of video states, and the items by which parameters travel through the graph.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"
#include "Core/VideoInterface/FlowState.h"
#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/Timecode.h"
#include "SyncSystem/Tick.h"
#include "SyncSystem/TypedId.h"

#include <cstdint>
#include <map>
#include <memory>
#include <string>

namespace KVZ
{

// One image, in the memory where the device has put it: whoever holds the buffer keeps the frame pinned there.
class VFlowVideoFrame : public IFlowItem
{
public:
  static const VFlowItemType ItemType;   // "FlowVideoFrame"

  using IFlowItem::IFlowItem;
  ~VFlowVideoFrame() override;
  const VFlowItemType& Type() const override { return ItemType; }

  VideoFrameInfo m_Info;
  ITimecode m_Timecode;   // standard -1 where the frame has none
  std::shared_ptr<const IBufferConst> m_pBuffer;
};

// The sound of one frame, interleaved, likewise in place.
class VFlowAudioFrame : public IFlowItem
{
public:
  static const VFlowItemType ItemType;   // "FlowAudioFrame"

  using IFlowItem::IFlowItem;
  ~VFlowAudioFrame() override;
  const VFlowItemType& Type() const override { return ItemType; }

  AudioFrameInfo m_Info;
  std::shared_ptr<const IBufferConst> m_pBuffer;
};

// Which device a frame comes from, and where it lies on the global timeline.
class VFlowCameraHardware : public IFlowItem
{
public:
  static const VFlowItemType ItemType;   // "FlowCameraHardware"

  using IFlowItem::IFlowItem;
  ~VFlowCameraHardware() override;
  const VFlowItemType& Type() const override { return ItemType; }

  std::string m_DeviceURN;
  std::string m_DeviceName;
  VTick m_Tick;   // global
  VTick m_Period;
  VGlobalSyncSessionId m_GlobalSession;
};

// Whom parameters are for. The default one means everybody.
struct VFlowTarget
{
  uint32_t m_Number = 0;
  std::string m_Name;

  bool operator==( const VFlowTarget& ) const = default;
  bool IsEverybody() const { return *this == VFlowTarget(); }
};

// Parameter names to texts.
using VFlowParameterTexts = std::map<std::string, std::string>;

class VFlowParameters : public IFlowItem
{
public:
  static const VFlowItemType ItemType;   // "FlowParametersItem"

  using IFlowItem::IFlowItem;
  ~VFlowParameters() override;
  const VFlowItemType& Type() const override { return ItemType; }

  VFlowTarget m_Target;
  VFlowParameterTexts m_Texts;
};

// A new item by the name of its type; an empty pointer for a name that is not known.
VFlowItemPtr MakeFlowItem( const std::string& i_rTypeName, const std::string& i_rLabel );

}
