// Frames a second of the conversions the software path and the packed formats depend on, at
// 1920 x 1080, for each vector form this processor runs. Compare with swscale_reference.sh.

#include "graphics/CoreVideoUtils/PixelFormatConverter.h"

#include <benchmark/benchmark.h>

#include <random>
#include <vector>

namespace
{
  using CoreVideoUtils::EInstructionSet;
  using namespace ZOL;

  constexpr std::int32_t Width = 1920, Height = 1080;

  std::vector< std::uint8_t > Frame( EPixelFormat i_Format )
  {
    std::vector< std::uint8_t > Bytes( CoreVideoUtils::FrameSizeInBytes( Width, Height, i_Format ) );
    std::mt19937 Generator( 1 );
    for( auto& b : Bytes )
      b = static_cast< std::uint8_t >( Generator() );
    return Bytes;
  }

  void Conversion( benchmark::State& io_rState, EPixelFormat i_From, EPixelFormat i_To, EInstructionSet i_Set,
                   float i_Gamma, float i_Saturation )
  {
    if( !CoreVideoUtils::IsSupported( i_Set ) )
    {
      io_rState.SkipWithError( "instruction set not available" );
      return;
    }
    const std::vector< std::uint8_t > Source = Frame( i_From );
    std::vector< std::uint8_t > Target( CoreVideoUtils::FrameSizeInBytes( Width, Height, i_To ) );
    CoreVideoUtils::VPixelFormatConverter Converter;
    Converter.SetInstructionSet( i_Set );
    IVideoSettings Settings;
    Settings.GammaCorrection = i_Gamma;
    Settings.Saturation = i_Saturation;
    Converter.SetVideoSettings( Settings );
    IVideoFrameInfo Info;
    Info.ImageWidth = Width;
    Info.ImageHeight = Height;
    Info.PixelFormat = i_From;
    for( auto _ : io_rState )
    {
      const bool bDone = Converter.Convert( Info, Source.data(), Source.size(), i_To, Target.data(), Target.size() );
      benchmark::DoNotOptimize( bDone );
      benchmark::ClobberMemory();
    }
    io_rState.counters["fps"] =
        benchmark::Counter( static_cast< double >( io_rState.iterations() ), benchmark::Counter::kIsRate );
    io_rState.SetBytesProcessed( static_cast< std::int64_t >( io_rState.iterations() ) * Source.size() );
  }

  void Register()
  {
    struct VSet
    {
      const char* Name;
      EInstructionSet Set;
    };
    const VSet Sets[] = { { "Scalar", EInstructionSet::Scalar },
                          { "SSE2", EInstructionSet::SSE2 },
                          { "AVX2", EInstructionSet::AVX2 },
                          { "AVX512", EInstructionSet::AVX512 } };
    for( const VSet& rSet : Sets )
    {
      const std::string Suffix = std::string( "/" ) + rSet.Name;
      benchmark::RegisterBenchmark( ( "BayerGB8_to_R8G8B8/plain" + Suffix ).c_str(), Conversion, PixelFormat_BayerGB8,
                                    PixelFormat_R8G8B8, rSet.Set, 1.0f, 1.0f );
      benchmark::RegisterBenchmark( ( "BayerGB8_to_R8G8B8/gamma_saturation" + Suffix ).c_str(), Conversion,
                                    PixelFormat_BayerGB8, PixelFormat_R8G8B8, rSet.Set, 1.8f, 1.4f );
      benchmark::RegisterBenchmark( ( "BayerGB8_to_R8G8B8/gamma" + Suffix ).c_str(), Conversion, PixelFormat_BayerGB8,
                                    PixelFormat_R8G8B8, rSet.Set, 1.8f, 1.0f );
      benchmark::RegisterBenchmark( ( "BayerGB8_to_R8G8B8/saturation" + Suffix ).c_str(), Conversion,
                                    PixelFormat_BayerGB8, PixelFormat_R8G8B8, rSet.Set, 1.0f, 1.4f );
      benchmark::RegisterBenchmark( ( "U8Y8V8Y8_to_R8G8B8" + Suffix ).c_str(), Conversion, PixelFormat_U8Y8V8Y8,
                                    PixelFormat_R8G8B8, rSet.Set, 1.0f, 1.0f );
    }
    // The unpacking picks its vector form by itself: one run each.
    benchmark::RegisterBenchmark( "BayerGB7_to_BayerGB8", Conversion, PixelFormat_BayerGB7, PixelFormat_BayerGB8,
                                  CoreVideoUtils::BestInstructionSet(), 1.0f, 1.0f );
    benchmark::RegisterBenchmark( "BayerGB6_to_BayerGB8", Conversion, PixelFormat_BayerGB6, PixelFormat_BayerGB8,
                                  CoreVideoUtils::BestInstructionSet(), 1.0f, 1.0f );
    benchmark::RegisterBenchmark( "Luminance7_to_Luminance8", Conversion, PixelFormat_Luminance7,
                                  PixelFormat_Luminance8, CoreVideoUtils::BestInstructionSet(), 1.0f, 1.0f );
    benchmark::RegisterBenchmark( "BayerGB7_to_R8G8B8", Conversion, PixelFormat_BayerGB7, PixelFormat_R8G8B8,
                                  CoreVideoUtils::BestInstructionSet(), 1.0f, 1.0f );
    benchmark::RegisterBenchmark( "U10Y10V10Y10_to_U8Y8V8Y8", Conversion, PixelFormat_U10Y10V10Y10,
                                  PixelFormat_U8Y8V8Y8, CoreVideoUtils::BestInstructionSet(), 1.0f, 1.0f );
  }
} // namespace

int main( int argc, char** argv )
{
  Register();
  benchmark::Initialize( &argc, argv );
  if( benchmark::ReportUnrecognizedArguments( argc, argv ) )
    return 1;
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
