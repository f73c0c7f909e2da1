#pragma once

#include <cstddef>
#include <vector>

namespace ComputeSubject
{

/// What a joint state should keep to, as rows beside those of the targets. Each row depends on one number of the state.
class IComputeJointConstraints
{
public:
  virtual ~IComputeJointConstraints() = default;
  virtual std::size_t ResidualCount() const = 0;
  /// The number of the state that a row is about.
  virtual std::size_t Degree( std::size_t i_Row ) const = 0;
  /// Rows about numbers that the state does not have are 0.
  virtual void Residual( const std::vector< double >& i_rState, double* o_pResidual ) const = 0;
  /// The diagonal: of each row by its own number.
  virtual void Derivative( const std::vector< double >& i_rState, double* o_pDerivative ) const = 0;
};

/// Keeps numbers of a state between limits: 0 inside, weight times the excess outside.
class VComputeJointLimits final : public IComputeJointConstraints
{
public:
  struct VLimit
  {
    std::size_t Degree = 0;
    double Low = 0, High = 0, Weight = 1;
  };

  /// Throws `VConstructionException` (`InvalidValue`) for a low above its high and for weights that are not finite;
  /// limits may be infinite.
  explicit VComputeJointLimits( std::vector< VLimit > i_Limits );

  std::size_t ResidualCount() const override { return m_Limits.size(); }
  std::size_t Degree( std::size_t i_Row ) const override { return m_Limits[i_Row].Degree; }
  void Residual( const std::vector< double >& i_rState, double* o_pResidual ) const override;
  void Derivative( const std::vector< double >& i_rState, double* o_pDerivative ) const override;

private:
  std::vector< VLimit > m_Limits;
};

} // namespace ComputeSubject
