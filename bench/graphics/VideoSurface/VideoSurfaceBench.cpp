// The cost of a frame on the video surface: PrepareFrame (and, in Software mode, the processor
// conversion) plus one paint, which uploads the frame and draws it. A paint is measured through
// grabFramebuffer, so it includes reading the widget's picture back; the "Repaint" case shows
// that part alone, with no upload.

#include "graphics/VideoSurface/VGLWidget.h"

#include <benchmark/benchmark.h>

#include <QApplication>
#include <QTest>

#include <cstdio>
#include <memory>
#include <random>

namespace
{
  constexpr int FrameWidth = 1920;
  constexpr int FrameHeight = 1080;

  ZOL::IVideoFrame BayerFrame()
  {
    ZOL::IVideoFrame Frame;
    Frame.VideoFrameInfo.ImageWidth = FrameWidth;
    Frame.VideoFrameInfo.ImageHeight = FrameHeight;
    Frame.VideoFrameInfo.PixelFormat = ZOL::PixelFormat_BayerGB8;
    auto pBuffer = std::make_shared< ZOL::IStandardBuffer >();
    pBuffer->Resize( std::uint64_t( FrameWidth ) * FrameHeight );
    std::mt19937 Random( 7 );
    for( std::uint64_t i = 0; i < pBuffer->GetSize(); ++i )
      pBuffer->GetData()[i] = std::uint8_t( Random() >> 24 );
    Frame.Video = pBuffer;
    return Frame;
  }

  std::unique_ptr< LumekVideoViewer::VGLWidget > MakeWidget( int i_Width, int i_Height,
                                                             LumekVideoViewer::EDecoder i_Decoder )
  {
    auto pWidget = std::make_unique< LumekVideoViewer::VGLWidget >();
    pWidget->setFixedSize( i_Width, i_Height );
    pWidget->SetDecoder( i_Decoder );
    pWidget->show();
    if( !QTest::qWaitForWindowExposed( pWidget.get() ) )
      std::fprintf( stderr, "the widget was not exposed\n" );
    return pWidget;
  }

  void PrepareAndPaint( benchmark::State& io_rState, LumekVideoViewer::EDecoder i_Decoder, int i_Width, int i_Height )
  {
    const ZOL::IVideoFrame Frame = BayerFrame();
    auto pWidget = MakeWidget( i_Width, i_Height, i_Decoder );
    ZOL::IVideoSettings Settings;
    Settings.GammaCorrection = 1.8f;
    Settings.Saturation = 1.2f;
    pWidget->SetVideoSettings( Settings );
    int Index = 0;
    for( auto _ : io_rState )
    {
      pWidget->PrepareFrame( Index++, Frame.VideoFrameInfo, Frame, false );
      benchmark::DoNotOptimize( pWidget->grabFramebuffer() );
    }
    io_rState.SetItemsProcessed( io_rState.iterations() );
  }

  void BM_PrepareAndPaint_Hardware( benchmark::State& io_rState )
  {
    PrepareAndPaint( io_rState, LumekVideoViewer::Hardware, int( io_rState.range( 0 ) ), int( io_rState.range( 1 ) ) );
  }

  void BM_PrepareAndPaint_Software( benchmark::State& io_rState )
  {
    PrepareAndPaint( io_rState, LumekVideoViewer::Software, int( io_rState.range( 0 ) ), int( io_rState.range( 1 ) ) );
  }

  // A paint of a frame already on the card: uniforms, one draw and the read-back.
  void BM_Repaint( benchmark::State& io_rState )
  {
    const ZOL::IVideoFrame Frame = BayerFrame();
    auto pWidget = MakeWidget( int( io_rState.range( 0 ) ), int( io_rState.range( 1 ) ), LumekVideoViewer::Hardware );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    pWidget->grabFramebuffer();
    for( auto _ : io_rState )
      benchmark::DoNotOptimize( pWidget->grabFramebuffer() );
  }

  BENCHMARK( BM_PrepareAndPaint_Hardware )
      ->Args( { 960, 540 } )
      ->Args( { 480, 270 } )
      ->Unit( benchmark::kMillisecond )
      ->UseRealTime();
  BENCHMARK( BM_PrepareAndPaint_Software )
      ->Args( { 960, 540 } )
      ->Args( { 480, 270 } )
      ->Unit( benchmark::kMillisecond )
      ->UseRealTime();
  BENCHMARK( BM_Repaint )->Args( { 960, 540 } )->Args( { 480, 270 } )->Unit( benchmark::kMillisecond )->UseRealTime();
} // namespace

int main( int argc, char** argv )
{
  benchmark::Initialize( &argc, argv );
  if( !qEnvironmentVariableIsSet( "DISPLAY" ) )
  {
    std::fprintf( stderr, "VideoSurfaceBench needs an X server: run it under xvfb-run\n" );
    return 0;
  }
  QCoreApplication::setAttribute( Qt::AA_ShareOpenGLContexts );
  QApplication Application( argc, argv );
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
