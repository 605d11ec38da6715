// What a device's settings change about its data source.
#pragma once

#include "SyncSystem/Tick.h"

namespace VideoInputHAL
{

// Called on the engine's thread; a source may be called from any thread.
class IVideoInputSourceControl
{
public:
  // A disabled source stays out of global sync sessions. True if the setting changed.
  virtual bool SetSourceEnabled( bool i_bEnabled ) = 0;
  // Whether the timecode in the frames lays the source on the timeline that sources share.
  virtual void SetUseTimecodeForSync( bool i_bUse ) = 0;
  // Width over height of one pixel, as it is written into the frame records and files.
  virtual void SetPixelAspectRatio( double i_Ratio ) = 0;
  // Added to every timecode; a whole number of the master clock's periods.
  virtual void SetTimecodeAdjustment( KVZ::VTick i_Adjustment ) = 0;
  virtual ~IVideoInputSourceControl() = default;
};

}
