#pragma once

#include <QtCore/QString>
#include <QtCore/QVariant>

#include <limits>
#include <variant>
#include <vector>

class QQmlPropertyMap;

namespace MoxelGraphics
{

/// `VSceneOptions::ContributionsType`: which rays from cameras to reconstructions are drawn.
enum ECentroidAssignments : int
{
  ENone = 0,
  EReconstructions = 1,
  ECameras = 2,
  EUnion = 3,
  EIntersection = 4
};

/// `VSceneOptions::CentroidColourScheme`.
enum ECentroidColourScheme : int
{
  EColourByConnection = 0,
  EColourByGenerator = 1,
  EColourByMarker = 2
};

/// `VSceneOptions::TrailUnit`: what the lengths of trails count.
enum ETrailUnit : int
{
  ETrailFrames = 0,
  ETrailSeconds = 1
};

/// What is shown of one kind of subject.
struct VDisplayRecord
{
  bool Enabled = true;
  bool Axes = false;
  bool Bones = true;
  bool Markers = true;
  bool Sticks = true;
  bool Joints = false;
  bool MissingMarkers = true;
  bool Origins = true;
  bool SticksDuringGaps = false;
  bool Targets = false;
  bool TargetCovariances = false;
  bool Clusters = true;
  bool Skin = true;
  bool SkinXRay = false;

  friend bool operator==( const VDisplayRecord&, const VDisplayRecord& ) = default;
};

/// The settings of one view as its renderer reads them. A field's key is its name; the two whose keys begin with a
/// digit, "3D" and "3DOpacity", are `Show3DOverlay` and `Opacity3DOverlay`. Adding a setting takes a field here and
/// a line in the table of VSceneOptions.cpp.
struct VSceneOptions
{
  bool CameraView = false;
  bool Show3DOverlay = true;
  bool Distort3D = false;
  bool YUp = false;
  double Opacity3DOverlay = 1.0;
  QString OverlayCamera; ///< device URN of the camera being drawn; empty in the free view
  bool GlobalAxis = true;
  bool FloorGrid = true;
  bool FloorGridIsTranslucent = true;
  bool ReconstructionVolume = true;
  float FloorGridSize = 6.0f; ///< m
  bool Cameras = true;
  bool CameraAxes = false;
  bool CameraCylinder = true;
  bool CameraFrustums = true;
  bool CameraRays = false;
  bool CameraMaskGrid = true;
  bool CameraShowRotated = true;
  bool CameraSnap90Degrees = true;
  bool CameraGreyscale = true;
  bool CameraMaximiseGreyscale = false;
  double CameraMaximiseGreyscaleFactor = 0.0;
  int CameraMaximiseGreyscaleHistory = 128; ///< frames
  bool CameraCentroids = true;
  bool CameraWandSmear = false;
  bool CameraBorder = false;
  bool Reconstructions = true;
  bool ReconstructedRadius = false;
  float ReconstructionScale = 1.0f;
  bool ReconstructionResiduals = false; ///< points are coloured by their residual
  int ContributionsType = ENone;        ///< ECentroidAssignments
  bool MarkerRadius = true;
  bool FillMethod = true;
  bool MarkerTrails = false;
  bool AllowTrailKeySelection = false;
  int trialLengthPast = 10;     ///< in `TrailUnit`
  int trialLengthFuture = 10;   ///< in `TrailUnit`
  int TrailUnit = ETrailFrames; ///< ETrailUnit
  bool Locators = true;
  bool RigidBodies = true;
  bool FBXScene = true;
  bool Threshold = false;
  bool ActiveLabelHalo = false;
  bool SubjectNames = true;
  bool MarkerNames = false;
  int LabelSize = 13;             ///< height of names in item pixels
  float LabelDistance = 20000.0f; ///< mm from the eye, beyond which names fade out; 0 for no end
  int LabelLimit = 60;            ///< so many names are shown at once, the nearest
  bool Manipulator = true;
  QString SubjectPreset;
  VDisplayRecord PropSubject;
  VDisplayRecord LabellingSubject;
  VDisplayRecord SolvingSubject;
  VDisplayRecord RetargetingSubject;
  VDisplayRecord SceneMesh;
  int BackgroundColorRGB = 0x202020; ///< 0xRRGGBB
  bool RenderInClipColor = false;
  bool HighlightCurrentSubject = true;
  int CentroidColourScheme = EColourByConnection; ///< ECentroidColourScheme
  int DebugVideo = 0;
  bool Video = true;
  bool SelectedReconCount = false;
  float ManipulatorScale = 1.0f;
  float ImageSetOpacity = 1.0f;
  QString ImageSetSearchExpression;

  friend bool operator==( const VSceneOptions&, const VSceneOptions& ) = default;
};

/// A field of a display record inside the options.
struct VDisplayField
{
  VDisplayRecord VSceneOptions::*pRecord;
  bool VDisplayRecord::*pField;
};

/// One row of the table that ties the keys of the options map to the fields of the record.
struct VOptionField
{
  using VMember = std::variant< bool VSceneOptions::*, int VSceneOptions::*, float VSceneOptions::*,
                                double VSceneOptions::*, QString VSceneOptions::*, VDisplayField >;
  QString Key;
  VMember Member;
  int Minimum = std::numeric_limits< int >::min(); ///< of whole numbers; others are refused
  int Maximum = std::numeric_limits< int >::max();
};

/// All keys, in the order of the record.
const std::vector< VOptionField >& SceneOptionFields();
/// Null when no field has that key.
const VOptionField* FindSceneOption( const QString& i_rKey );

/// The value of a field as the map holds it.
QVariant GetSceneOption( const VSceneOptions& i_rOptions, const VOptionField& i_rField );
/// False, with the field left as it was, when the value is none of the field's type: texts that are no number or no
/// "true"/"false", numbers that are not finite, whole numbers out of the field's range, undefined.
bool SetSceneOption( VSceneOptions& io_rOptions, const VOptionField& i_rField, const QVariant& i_rValue );

/// Writes every field into the map.
void WriteSceneOptions( const VSceneOptions& i_rOptions, QQmlPropertyMap& o_rMap );
/// Reads every key of the table from the map. An entry that does not convert is logged at level 3 and gets the
/// field's value back. Keys outside the table are left alone.
void ReadSceneOptions( QQmlPropertyMap& io_rMap, VSceneOptions& io_rOptions );

} // namespace MoxelGraphics
