// Owns one card object of the vendor's library.
#pragma once

#include "VendorInterfaces/BlueVelvet.h"

#include <cstdint>
#include <optional>

namespace VideoInputHAL
{

// Not for several threads at once. Without a card object, every operation fails.
class VBluefish444SDKWrapper
{
public:
  // The functions outlive it.
  explicit VBluefish444SDKWrapper( const BlueVelvet::VFlatFunctions& i_rFunctions );
  // Detaches and frees the card object.
  ~VBluefish444SDKWrapper();
  VBluefish444SDKWrapper( const VBluefish444SDKWrapper& ) = delete;
  VBluefish444SDKWrapper& operator=( const VBluefish444SDKWrapper& ) = delete;

  int DeviceCount();
  // Cards count from 1, inputs from 0.
  bool Attach( int i_Card );
  bool AttachInput( int i_Card, uint32_t i_Input );
  // Of the attached card; one outside every table where it does not tell.
  int CardType();

  std::optional<uint32_t> Query( int i_Property );
  bool Set( int i_Property, uint32_t i_Value );
  void StopVideoCapture();
  // Blocks until the next frame of the input; gives the field count.
  std::optional<uint64_t> WaitForInputSync();
  // The buffer that is filled next: its number, with what is captured into it.
  void CaptureInto( uint32_t i_BufferId );
  bool ReadBuffer( uint8_t* o_pTarget, uint64_t i_Size, uint32_t i_BufferId );
  bool DecodeHanc( int i_CardType, uint8_t* i_pHanc, BlueVelvet::VHancDecodeRecord& io_rRecord );

  const BlueVelvet::VFlatFunctions& Functions() const { return m_rFunctions; }

private:
  const BlueVelvet::VFlatFunctions& m_rFunctions;
  BlueVelvet::CBlueVelvet4* const m_pCard;
};

}
