// Virtual capture cards in this process: the library of their kind is loaded before the module looks for the vendor's, whose name it bears.
#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

namespace VirtualCards
{
class IVirtualCardControl;
}

namespace StageHost
{

class VVirtualCards
{
public:
  VVirtualCards() = default;
  // Takes the cards out and ends their threads; the module must have been stopped.
  ~VVirtualCards();
  VVirtualCards( const VVirtualCards& ) = delete;
  VVirtualCards& operator=( const VVirtualCards& ) = delete;

  // Takes a card's text (KIND[:KEY=VALUE[,KEY=VALUE]...]); false with one line in o_rError, and no card is added then.
  bool Add( const std::string& i_rText, std::string& o_rError );
  size_t Count() const { return m_Cards.size(); }
  // Devices that the module finds in the cards when they are all in the machine.
  size_t CountDevices() const;

private:
  VirtualCards::IVirtualCardControl* Load( const std::string& i_rKind, std::string& o_rError );

  std::map<std::string, VirtualCards::IVirtualCardControl*> m_Controls;           // by kind; loaded once, never unloaded
  std::vector<std::pair<VirtualCards::IVirtualCardControl*, uint32_t>> m_Cards;   // with the card's id
};

}
