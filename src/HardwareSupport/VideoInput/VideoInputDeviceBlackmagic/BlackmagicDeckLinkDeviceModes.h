// The vendor's codes for display modes, pixel formats and audio beside ours. Any thread may call.
#pragma once

#include "Core/VideoInterface/AudioSampleFormat.h"
#include "Core/VideoInterface/PixelFormat.h"
#include "Core/VideoInterface/VideoStandard.h"

#include <cstdint>

namespace VideoInputHAL
{

// "Unspecified", and a line in the log, for a mode that is none of ours.
KVZ::IVideoStandard::Enum ToVideoStandard( uint32_t i_DisplayMode );

// 0, which no card takes, and a line in the log for a format that cards do not deliver.
uint32_t ToVendorPixelFormat( KVZ::IPixelFormat::Enum i_PixelFormat );

// "Luminance8", and a line in the log, for a format that is none of ours.
KVZ::IPixelFormat::Enum ToPixelFormat( uint32_t i_VendorPixelFormat );

// The vendor's sample types are 16 and 32 bits; any format but Int32 is asked for as 16.
uint32_t ToVendorSampleType( KVZ::IAudioSampleFormat::Enum i_Format );

// 48000 is the only rate; another leaves a line in the log.
uint32_t ToVendorSampleRate( uint32_t i_SampleRate );

}
