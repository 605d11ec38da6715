// How long a recording can go on until its container, or the container's index, is full.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/VideoWriter.h"

#include <limits>
#include <string>

// What one device's file holds.
struct VStoredFormat
{
  KVZ::IVideoContainer::Enum m_Container = KVZ::IVideoContainer::ETVID;
  uint64_t m_ImageBytes = 0;    // of a frame; 0 where the images are compressed
  uint32_t m_FramePeriod = 0;   // ticks of 1/135000000 s; 0 where it is not known
  KVZ::AudioFrameInfo m_Audio{};
};

struct VRunLimit
{
  static constexpr double Endless = std::numeric_limits<double>::infinity();

  double m_Seconds = Endless;
  std::string m_What = {};      // "a MOV file"
  bool m_bIndexAlone = false;   // frames behind the limit are still stored and played, but not sought
};

// The first limit that the file meets. Endless where no disk reaches one, and where it cannot be known before.
VRunLimit FindRunLimit( const VStoredFormat& i_rFormat );

// What a person is told of one device's limit.
class VLimitNotice
{
public:
  VLimitNotice( std::string i_DeviceURN, VRunLimit i_Limit ) : m_DeviceURN( std::move( i_DeviceURN ) ), m_Limit( std::move( i_Limit ) ) {}

  const std::string& DeviceURN() const { return m_DeviceURN; }
  // Whether the limit is less than a day away.
  bool IsNear() const;
  double Seconds() const { return m_Limit.m_Seconds; }

  // When the recording starts: one line where the limit is near, or nearer than what was asked for; otherwise empty.
  std::string AtStart( double i_RequestedSeconds ) const;
  // While it runs: one line, once, some minutes before the limit; otherwise empty.
  std::string After( double i_CapturedSeconds );

private:
  const std::string m_DeviceURN;
  const VRunLimit m_Limit;
  bool m_bWarned = false;
};
