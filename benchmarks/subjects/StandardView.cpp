#include "StandardScene.h"

#include <HostServices/VSelectionService.h>

#include <map>

namespace SubjectsBench
{
namespace
{
MoxelGraphics::VSceneOptions StandardOptions()
{
  MoxelGraphics::VSceneOptions Options;
  // Points have the sizes that the states give them, the floor is solid.
  Options.ReconstructedRadius = true;
  Options.FloorGridIsTranslucent = false;
  // Off, because the standard scene has none of it: axes in the corner and on bones, the volume, names, the marks of
  // missing markers, origins, clusters and skins.
  Options.GlobalAxis = false;
  Options.ReconstructionVolume = false;
  Options.SubjectNames = false;
  Options.LabellingSubject.MissingMarkers = false;
  Options.LabellingSubject.Origins = false;
  Options.LabellingSubject.Clusters = false;
  Options.LabellingSubject.Skin = false;
  return Options;
}

/// Of a view: world from eye.
QMatrix4x4 StandardPose()
{
  QMatrix4x4 View;
  View.lookAt( { 7000, -7000, 4500 }, { 0, 0, 800 }, { 0, 0, 1 } );
  return View.inverted();
}
} // namespace

VStandardView::VStandardView( int i_Scale )
  : pScene( std::make_shared< VStandardScene >( MakeStates( VStandardData( i_Scale ) ),
                                                std::make_shared< HostServices::VSelectionService >() ) )
  , Frame( pScene, std::make_shared< CoreGraphics::VCameraController >() )
{
  CoreGraphics::VCameraController& rController = Frame.Controller();
  rController.SetSize( { Width, Height } );
  // The controller orbits about a pose: taken such that its first view, seen from there, is the wanted one.
  rController.Step();
  rController.SetLockPose( StandardPose() * rController.Fields().view );
  Frame.Resize( { Width, Height } );
  Frame.Input().Options = StandardOptions();
}

VStandardView& StandardView( int i_Scale )
{
  // Lives as long as the program: its buffers may outlive the context.
  static auto& rViews = *new std::map< int, std::unique_ptr< VStandardView > >;
  std::unique_ptr< VStandardView >& rpView = rViews[i_Scale];
  if ( !rpView )
  {
    rpView = std::make_unique< VStandardView >( i_Scale );
  }
  return *rpView;
}

} // namespace SubjectsBench
