// What travels through the host's flow graph: states, each a handful of typed items with labels.
//
// Whoever makes a state fills it alone; once it has been written to an output it is shared with every reader and changes no more.
#pragma once

#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace KVZ
{

// Of the item types there is one instance each, so two types are the same exactly when their addresses are.
struct VFlowItemType
{
  const char* m_pName;
  const char* m_pDescription;
};

class IFlowItem
{
public:
  explicit IFlowItem( std::string i_Label ) : m_Label( std::move( i_Label ) ) {}
  IFlowItem( const IFlowItem& ) = delete;
  IFlowItem& operator=( const IFlowItem& ) = delete;
  virtual ~IFlowItem();

  virtual const VFlowItemType& Type() const = 0;
  const std::string& Label() const { return m_Label; }

private:
  const std::string m_Label;
};

using VFlowItemPtr = std::shared_ptr<IFlowItem>;
using VFlowItemList = std::vector<VFlowItemPtr>;

class IFlowState
{
public:
  virtual ~IFlowState();
  virtual void SetCategory( const std::string& i_rCategory ) = 0;
  virtual const std::string& Category() const = 0;
  virtual void AddItem( VFlowItemPtr i_pItem ) = 0;
  // In the order in which they were added.
  virtual const VFlowItemList& Items() const = 0;
  // A new state of the same category with the same items, which are shared.
  virtual std::shared_ptr<IFlowState> Clone() const = 0;
};

using VFlowStatePtr = std::shared_ptr<IFlowState>;

// Named lists of numbers, for analysis.
class VFlowGenericData : public IFlowItem
{
public:
  static const VFlowItemType ItemType;   // "FlowGenericData"

  using IFlowItem::IFlowItem;
  ~VFlowGenericData() override;
  const VFlowItemType& Type() const override { return ItemType; }

  // The first number of a list; false, with the output left alone, where there is none.
  bool GetNumber( const std::string& i_rName, double& o_rValue ) const;

  std::map<std::string, std::vector<double>, std::less<>> m_Values;
};

// The labels that go with the item types.
namespace FlowLabels
{
constexpr const char* VideoFrame = "VideoFrame Item";
constexpr const char* AudioFrame = "AudioFrame Item";
constexpr const char* CameraHardware = "CameraHardware Item";
constexpr const char* GenericData = "GenericData Item";
}

}
