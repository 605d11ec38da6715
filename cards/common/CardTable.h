// All virtual cards of one library, steered through its control interface.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "cards/common/VirtualCardControl.h"

#include <boost/thread/mutex.hpp>

#include <map>
#include <memory>
#include <vector>

namespace VirtualCards
{

// A card as the table knows it. Any thread may call, but for what Begin and End say.
class IVirtualCard
{
public:
  virtual ~IVirtualCard() = default;

  // The card comes into the machine, unless its script says later, and its frames begin to pass.
  virtual void Begin() = 0;
  // The card's thread ends, and the card goes out of the machine. Not on the card's thread.
  virtual void End() = 0;
  virtual bool IsCardThread() const = 0;
  virtual bool Step( uint64_t i_Frames ) = 0;
  virtual bool RunEvent( const char* i_pEvent, std::string& o_rError ) = 0;
  virtual void SetBusy( bool i_bBusy ) = 0;
  virtual VCardCounters Counters() const = 0;
  // That a driver finds in it.
  virtual uint32_t CountDevices() const = 0;
};

class VCardTable : public IVirtualCardControl
{
public:
  VCardId AddCard( const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError ) override;
  bool RemoveCard( VCardId i_Card ) override;
  bool Step( VCardId i_Card, uint64_t i_Frames ) override;
  bool RunEvent( VCardId i_Card, const char* i_pEvent, std::string& o_rError ) override;
  bool SetBusy( VCardId i_Card, bool i_bBusy ) override;
  uint32_t CountDevices( VCardId i_Card ) const override;
  bool GetCounters( VCardId i_Card, VCardCounters& o_rCounters ) const override;

protected:
  ~VCardTable() = default;

  // A card of this library's kind. Null, with one line of reason, if the text cannot be understood or what it names cannot be opened.
  virtual std::shared_ptr<IVirtualCard> MakeCard( VCardId i_Id, const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError ) = 0;

  // In the order of their coming.
  std::vector<std::shared_ptr<IVirtualCard>> Cards() const;

private:
  std::shared_ptr<IVirtualCard> Find( VCardId i_Card ) const;

  mutable boost::mutex m_CardsMutex;
  VCardId m_LastId GUARDED_BY( m_CardsMutex ) = 0;
  std::map<VCardId, std::shared_ptr<IVirtualCard>> m_Cards GUARDED_BY( m_CardsMutex );
};

}
