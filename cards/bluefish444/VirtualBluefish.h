// One virtual card with up to four inputs, all of which carry the signal that the card's text describes.
#pragma once

#include "cards/bluefish444/Input.h"
#include "cards/common/CardTable.h"

#include <atomic>
#include <memory>
#include <string>
#include <vector>

namespace VirtualCards
{

class VVirtualBluefish final : public IVirtualCard
{
public:
  // Null, with one line of reason, if the text cannot be understood or what it names cannot be opened.
  static std::shared_ptr<VVirtualBluefish> Make( VCardId i_Id, const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError );

  void Begin() override;
  void End() override;
  bool IsCardThread() const override;
  // Frame by frame, on all inputs.
  bool Step( uint64_t i_Frames ) override;
  bool RunEvent( const char* i_pEvent, std::string& o_rError ) override;
  void SetBusy( bool i_bBusy ) override { m_bBusy = i_bBusy; }
  VCardCounters Counters() const override;
  uint32_t CountDevices() const override;

  bool IsBusy() const { return m_bBusy; }
  // In the machine.
  bool IsPresent() const;
  // A card's own properties; false for one that it does not answer.
  bool Query( int i_Property, uint32_t& o_rValue ) const;
  // Null for an input that the card does not have. Counts from 0.
  VBluefishInput* Input( uint32_t i_Index ) { return i_Index < m_Inputs.size() ? m_Inputs[i_Index].get() : nullptr; }

private:
  explicit VVirtualBluefish( const VCardSpec& i_rSpec ) : m_Spec( i_rSpec ) {}

  const VCardSpec m_Spec;
  std::vector<std::unique_ptr<VBluefishInput>> m_Inputs;   // fixed after Make
  std::atomic<bool> m_bBusy{ false };
  std::atomic<bool> m_bEnded{ false };
};

}
