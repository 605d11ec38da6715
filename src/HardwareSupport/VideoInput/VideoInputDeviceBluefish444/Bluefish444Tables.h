// The vendor's numbers for cards, channels, modes, memory formats and sound beside ours. Any thread may call.
#pragma once

#include "Core/VideoInterface/AudioSampleFormat.h"
#include "Core/VideoInterface/PixelFormat.h"
#include "Core/VideoInterface/VideoStandard.h"

#include <cstdint>
#include <string>

namespace VideoInputHAL
{

constexpr const char* Bluefish444LogCategory = "VideoInputDeviceBluefish444";

// What a driver gives for "no signal" that does not tell: the value of the 5.x generation.
constexpr uint32_t DefaultNoSignalMode = 44;

constexpr uint32_t MostAudioChannels = 16;

// "Unknown card" for a type outside the table.
std::string CardName( int i_CardType );

// "A" to "D"; "?" for what is no input channel.
std::string ChannelLetter( uint32_t i_Channel );

// Leads the channel's connector to its frame store. A line in the log for what is no input channel.
uint32_t ChannelRouting( uint32_t i_Channel );

// SD_720_576I_5000, and a line in the log, for a mode that carries no video or that is none of the card's.
KVZ::IVideoStandard::Enum StandardOfMode( uint32_t i_Mode );

// 0, and a line in the log, for a format that cards do not deliver.
uint32_t ToMemoryFormat( KVZ::IPixelFormat::Enum i_PixelFormat );

// Samples of each channel that belong to a frame of this period (ticks); 0 for a period outside the table.
uint32_t SamplesPerFrame( int64_t i_FramePeriod );

// A bit for each of so many channels; the two behind the eighth belong to the analogue outputs.
uint32_t ChannelMask( uint32_t i_Channels );

// What the decoder is told of a sample, and the bytes that it writes for one: any format but Int24 and Int32 is asked for as 16 bits.
struct VSampleType
{
  uint32_t m_Flags;
  uint32_t m_Bytes;
};
VSampleType ToSampleType( KVZ::IAudioSampleFormat::Enum i_Format );

}
