#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace ComputeCameraModel
{

/// A place on the sensor, px.
struct VImagePoint
{
  double x = 0, y = 0;
};

/// The part of a calibration that tells of the lens.
struct VLensCalibration
{
  std::uint32_t Model = 2;
  std::vector< double > m_RadialParameters; ///< 1/px^2, 1/px^4, 1/px^6
  VImagePoint Centre;                       ///< (0, 0) means no distortion
};

/// The lens in double precision. Image points are raw; correcting one scales its offset from the centre by
/// 1 + K1 d^2 + K2 d^4 + K3 d^6, d its distance. Distorting is the inverse.
///
/// Models: 0 has two parameters, 1 three, 2 none. Another one, or another number of parameters, is an assertion and
/// then a lens without distortion. Thread: any, as nothing changes after construction.
class VRadialDistortion
{
public:
  explicit VRadialDistortion( VLensCalibration i_LensCalibration );

  /// False, with the point left alone, beyond the domain on which the polynomial rises.
  bool Correct( const VImagePoint& i_rRaw, VImagePoint& o_rCorrected ) const;
  bool Distort( const VImagePoint& i_rCorrected, VImagePoint& o_rRaw ) const;

  /// Squares of the greatest distances from the centre that can be corrected and distorted, px^2.
  double MaxRawRadiusSq() const { return m_MaxRawRadiusSq; }
  double MaxCorrectedRadiusSq() const { return m_MaxCorrectedRadiusSq; }
  /// The derivative of corrected by raw distance from the centre.
  double Slope( double i_RawRadius ) const;
  /// False where correcting changes no point.
  bool IsDistorting() const { return m_bDistorting; }
  const VLensCalibration& LensCalibration() const { return m_LensCalibration; }

protected:
  /// The factor of an offset of that squared length.
  double Scale( double i_RadiusSq ) const
  {
    return 1 + i_RadiusSq * ( m_K[0] + i_RadiusSq * ( m_K[1] + i_RadiusSq * m_K[2] ) );
  }
  std::array< double, 3 > m_K{};

private:
  void FindDomain();
  void LimitToFirstFold();
  double Solve( double i_Distance ) const;
  double SolveByHalves( double i_Distance ) const;

  VLensCalibration m_LensCalibration;
  std::size_t m_NumParameters = 0;
  double m_MaxRawRadiusSq = 0;
  double m_MaxCorrectedRadiusSq = 0;
  bool m_bDistorting = false;
};

/// The same with the derivatives of the maps, row-major by x and y of the point that goes in.
class VRadialDistortionJacobian : public VRadialDistortion
{
public:
  using VJacobian = std::array< double, 4 >;
  using VRadialDistortion::Correct;
  using VRadialDistortion::Distort;
  using VRadialDistortion::VRadialDistortion;

  bool Correct( const VImagePoint& i_rRaw, VImagePoint& o_rCorrected, VJacobian& o_rJacobian ) const;
  bool Distort( const VImagePoint& i_rCorrected, VImagePoint& o_rRaw, VJacobian& o_rJacobian ) const;

private:
  VJacobian AtRaw( const VImagePoint& i_rRaw ) const;
};

} // namespace ComputeCameraModel
