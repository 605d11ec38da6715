// One virtual card: its signal, its clock, and the object by which clients know it while it is in the machine.
#pragma once

#include "cards/common/CardParts.h"
#include "cards/common/CardRunner.h"
#include "cards/common/CardTable.h"
#include "cards/decklink/DeckLinkObject.h"

#include <atomic>
#include <memory>
#include <string>

namespace VirtualCards
{

class VVirtualDeckLink final : public IVirtualCard, public ICardFrames, public std::enable_shared_from_this<VVirtualDeckLink>
{
public:
  // Null, with one line of reason, if the text cannot be understood or what it names cannot be opened.
  static std::shared_ptr<VVirtualDeckLink> Make( VCardId i_Id, const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError );
  ~VVirtualDeckLink() override;

  void Begin() override;
  void End() override;
  bool IsCardThread() const override { return m_Runner.IsCardThread(); }
  bool Step( uint64_t i_Frames ) override { return m_Runner.Step( i_Frames ); }
  bool RunEvent( const char* i_pEvent, std::string& o_rError ) override;
  void SetBusy( bool i_bBusy ) override { m_bBusy = i_bBusy; }
  bool IsBusy() const { return m_bBusy; }
  VCardCounters Counters() const override;
  uint32_t CountDevices() const override { return 1; }

  VCardRunner& Runner() { return m_Runner; }
  ISignalContent& Content() { return *m_Source.m_pContent; }
  void CountDelivered() { ++m_Delivered; }
  void CountWithoutBuffer() { ++m_WithoutBuffer; }
  void CountFormatChange() { ++m_FormatChanges; }

  void OnPresence( bool i_bPresent ) override;
  void OnFrame( const VSignalFrame& i_rFrame ) override;

private:
  VVirtualDeckLink( VCardId i_Id, const VCardParts& i_rParts, const VCardOptions& i_rOptions );

  const VCardId m_Id;
  const VCardKind& m_rKind;
  const VSignalSource m_Source;

  std::atomic<bool> m_bBusy{ false };
  std::atomic<uint64_t> m_Delivered{ 0 };
  std::atomic<uint64_t> m_WithoutBuffer{ 0 };
  std::atomic<uint64_t> m_FormatChanges{ 0 };

  // Card's thread, and whoever begins and ends the card while it has none
  VDeckLinkObject* m_pObject = nullptr;   // null while the card is out of the machine

  VCardRunner m_Runner;   // last: it calls this object
};

}
