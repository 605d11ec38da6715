// Steers the virtual cards of one library. A library exports the function that gives this interface beside the vendor's own names:
//
//   extern "C" VirtualCards::IVirtualCardControl* GetVirtualCardControl();
//
// Any thread may call, but not from inside a card's callback where it says so. The object lives as long as the process.
#pragma once

#include <cstdint>
#include <string>

namespace VirtualCards
{

// 0 for none; never used twice.
using VCardId = uint32_t;

struct VCardOptions
{
  bool m_bManualClock = false;   // frames pass only in Step
};

struct VCardCounters
{
  uint64_t m_FramesPassed = 0;          // of the signal, whether or not anybody got them
  uint64_t m_FramesDelivered = 0;       // handed to a client
  uint64_t m_FramesDropped = 0;         // by the script, or because a client was seconds behind
  uint64_t m_FramesWithoutBuffer = 0;   // a client kept all of the card's buffers
  uint64_t m_FormatChanges = 0;         // told to a client
  uint32_t m_ClientsWaiting = 0;        // for the next frame, now; of cards that are polled
};

class IVirtualCardControl
{
public:
  // Makes a card of the text (CardSpec.h says what it may hold) and puts it into the machine. 0, with one line that names the key, the
  // reason and what would be accepted, if that is not possible. Who looks for cards already hears of it before this returns, unless the
  // card's script lets it arrive later or a notification is under way on another thread.
  virtual VCardId AddCard( const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError ) = 0;

  // Takes a card out for good; returns when its thread has ended. False for an unknown card and from inside one of its callbacks.
  // With no lock held that the card's client takes in a callback.
  virtual bool RemoveCard( VCardId i_Card ) = 0;

  // Lets frames of a card with a manual clock pass; returns when they have. False for other cards and from inside a callback.
  virtual bool Step( VCardId i_Card, uint64_t i_Frames ) = 0;

  // Makes an event happen before the next frame: {"do": "signal-loss", "frames": 25}, as in a script but without "frame".
  virtual bool RunEvent( VCardId i_Card, const char* i_pEvent, std::string& o_rError ) = 0;

  // The card is in use by another program: it cannot be enabled.
  virtual bool SetBusy( VCardId i_Card, bool i_bBusy ) = 0;

  // Devices that a driver finds in this card while it is in the machine; 0 for an unknown card, and for one that is away and
  // would not be found when it comes.
  virtual uint32_t CountDevices( VCardId i_Card ) const = 0;

  // False for an unknown card.
  virtual bool GetCounters( VCardId i_Card, VCardCounters& o_rCounters ) const = 0;

  // References on this library's objects that clients hold; 0 when everything has been given back. The library's own are not counted.
  virtual int64_t ReferencesHeld() const = 0;
  // Objects that were released once too often, where that can be noticed.
  virtual int64_t ReleaseErrors() const = 0;
  // Callbacks of all cards that are running now.
  virtual int32_t CallbacksInFlight() const = 0;

protected:
  ~IVirtualCardControl() = default;
};

using GetVirtualCardControlFunction = IVirtualCardControl*();
constexpr const char* GetVirtualCardControlName = "GetVirtualCardControl";

}
