// Virtual capture cards in this process: the library of their kind is loaded before the module looks for the vendor's, whose name it bears.
#pragma once

#include <map>
#include <string>
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
  // Takes a card's text (KIND[:KEY=VALUE[,KEY=VALUE]...]); false with one line in o_rError, and no card is added then.
  bool Add( const std::string& i_rText, std::string& o_rError );
  size_t Count() const { return m_Count; }

private:
  VirtualCards::IVirtualCardControl* Load( const std::string& i_rKind, std::string& o_rError );

  std::map<std::string, VirtualCards::IVirtualCardControl*> m_Controls;   // by kind; loaded once, never unloaded
  size_t m_Count = 0;
};

}
