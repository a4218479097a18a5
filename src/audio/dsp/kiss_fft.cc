#include "audio/dsp/kiss_fft.h"

#include <cmath>
#include <cstdlib>
#include <utility>

// Angle brackets: a quoted "kiss_fft.h" would find this unit's own header.
#include <kiss_fft.h>
#include <kiss_fftr.h>

#include "base/logging.h"

// The size checks compare container sizes with int sizes; both are known to
// be non-negative.
#pragma GCC diagnostic ignored "-Wsign-compare"

namespace audio_dsp {

// One complex transform size, one algorithm. Unnormalised in both directions;
// input and output address GetSize() values each.
class ComplexFFTTransformerImpl {
 public:
  virtual ~ComplexFFTTransformerImpl() = default;
  virtual int GetSize() const = 0;
  virtual void Forward(const std::complex<float>* input, std::complex<float>* output) const = 0;
  virtual void Inverse(const std::complex<float>* input, std::complex<float>* output) const = 0;
};

// One real transform size: GetSize() reals in, GetSize() / 2 + 1 bins out, and
// back. Unnormalised in both directions.
class RealFFTTransformerImpl {
 public:
  virtual ~RealFFTTransformerImpl() = default;
  virtual int GetSize() const = 0;
  virtual void Forward(const float* input, std::complex<float>* output) const = 0;
  virtual void Inverse(const std::complex<float>* input, float* output) const = 0;
};

namespace {

constexpr double kPi = 3.14159265358979323846;

const kiss_fft_cpx* AsKiss(const std::complex<float>* values) {
  return reinterpret_cast<const kiss_fft_cpx*>(values);
}
kiss_fft_cpx* AsKiss(std::complex<float>* values) {
  return reinterpret_cast<kiss_fft_cpx*>(values);
}

class KissComplexFFTTransformerImpl : public ComplexFFTTransformerImpl {
 public:
  explicit KissComplexFFTTransformerImpl(int size)
      : size_(size),
        forward_config_(CHECK_ALLOCATED(kiss_fft_alloc(size, 0, nullptr, nullptr))),
        inverse_config_(CHECK_ALLOCATED(kiss_fft_alloc(size, 1, nullptr, nullptr))) {}
  ~KissComplexFFTTransformerImpl() override {
    free(forward_config_);
    free(inverse_config_);
  }
  KissComplexFFTTransformerImpl(const KissComplexFFTTransformerImpl&) = delete;
  KissComplexFFTTransformerImpl& operator=(const KissComplexFFTTransformerImpl&) = delete;

  int GetSize() const override { return size_; }
  void Forward(const std::complex<float>* input, std::complex<float>* output) const override {
    kiss_fft(forward_config_, AsKiss(input), AsKiss(output));
  }
  void Inverse(const std::complex<float>* input, std::complex<float>* output) const override {
    kiss_fft(inverse_config_, AsKiss(input), AsKiss(output));
  }

 private:
  const int size_;
  const kiss_fft_cfg forward_config_;
  const kiss_fft_cfg inverse_config_;
};

// Bluestein's chirp-z transform: with jk = (j² + k² − (k − j)²) / 2 the DFT
// becomes a chirp, a circular convolution with the chirp e^(+iπm²/N), and a
// chirp again. The convolution runs through kissfft at the fast size
// M ≥ 2N − 1, so that the circular wrap never overlaps the wanted terms.
class BluesteinComplexFFTTransformerImpl : public ComplexFFTTransformerImpl {
 public:
  explicit BluesteinComplexFFTTransformerImpl(int size)
      : size_(size), inner_(kiss_fft_next_fast_size(2 * size - 1)) {
    const int inner_size = inner_.GetSize();
    std::vector<std::complex<float>> kernel(inner_size);
    post_chirp_.resize(size);
    // Chirp phases e^(+iπk²/N) by recurrence in double precision; the
    // accumulated rounding stays far below single precision for any int size.
    const std::complex<double> step = std::polar(1.0, 2.0 * kPi / size);
    std::complex<double> ratio = std::polar(1.0, kPi / size);
    std::complex<double> chirp = 1.0;
    kernel[0] = 1.0f;
    post_chirp_[0] = 1.0f / inner_size;
    for (int k = 1; k < size; ++k) {
      chirp *= ratio;
      ratio *= step;
      const std::complex<float> value(chirp);
      kernel[k] = value;
      kernel[inner_size - k] = value;
      post_chirp_[k] = std::conj(value) / static_cast<float>(inner_size);
    }
    kernel_spectrum_.resize(inner_size);
    inner_.Forward(kernel.data(), kernel_spectrum_.data());
  }

  int GetSize() const override { return size_; }

  void Forward(const std::complex<float>* input, std::complex<float>* output) const override {
    const int inner_size = inner_.GetSize();
    std::vector<std::complex<float>> work(inner_size);
    std::vector<std::complex<float>> spectrum(inner_size);
    PreChirp(input, -1.0, work.data());
    inner_.Forward(work.data(), spectrum.data());
    for (int k = 0; k < inner_size; ++k) spectrum[k] *= kernel_spectrum_[k];
    inner_.Inverse(spectrum.data(), work.data());
    for (int k = 0; k < size_; ++k) output[k] = work[k] * post_chirp_[k];
  }

  void Inverse(const std::complex<float>* input, std::complex<float>* output) const override {
    const int inner_size = inner_.GetSize();
    std::vector<std::complex<float>> work(inner_size);
    std::vector<std::complex<float>> spectrum(inner_size);
    PreChirp(input, 1.0, work.data());
    inner_.Forward(work.data(), spectrum.data());
    // The conjugate chirp's spectrum is conj(B[−k]) = conj(B[M − k]).
    spectrum[0] *= std::conj(kernel_spectrum_[0]);
    for (int k = 1; k < inner_size; ++k) spectrum[k] *= std::conj(kernel_spectrum_[inner_size - k]);
    inner_.Inverse(spectrum.data(), work.data());
    for (int k = 0; k < size_; ++k) output[k] = work[k] * std::conj(post_chirp_[k]);
  }

 private:
  // work[k] = input[k] × e^(sign × iπk²/N) for k < N; work is already zero
  // beyond N.
  void PreChirp(const std::complex<float>* input, double sign, std::complex<float>* work) const {
    const std::complex<double> step = std::polar(1.0, sign * 2.0 * kPi / size_);
    std::complex<double> ratio = std::polar(1.0, sign * kPi / size_);
    std::complex<double> chirp = 1.0;
    for (int k = 0; k < size_; ++k) {
      work[k] = input[k] * std::complex<float>(chirp);
      chirp *= ratio;
      ratio *= step;
    }
  }

  const int size_;
  std::vector<std::complex<float>> kernel_spectrum_;  // M values.
  std::vector<std::complex<float>> post_chirp_;       // N values, 1/M folded in.
  KissComplexFFTTransformerImpl inner_;
};

class KissRealFFTTransformerImpl : public RealFFTTransformerImpl {
 public:
  explicit KissRealFFTTransformerImpl(int size)
      : size_(size),
        forward_config_(CHECK_ALLOCATED(kiss_fftr_alloc(size, 0, nullptr, nullptr))),
        inverse_config_(CHECK_ALLOCATED(kiss_fftr_alloc(size, 1, nullptr, nullptr))) {}
  ~KissRealFFTTransformerImpl() override {
    free(forward_config_);
    free(inverse_config_);
  }
  KissRealFFTTransformerImpl(const KissRealFFTTransformerImpl&) = delete;
  KissRealFFTTransformerImpl& operator=(const KissRealFFTTransformerImpl&) = delete;

  int GetSize() const override { return size_; }
  void Forward(const float* input, std::complex<float>* output) const override {
    kiss_fftr(forward_config_, input, AsKiss(output));
  }
  void Inverse(const std::complex<float>* input, float* output) const override {
    kiss_fftri(inverse_config_, AsKiss(input), output);
  }

 private:
  const int size_;
  const kiss_fftr_cfg forward_config_;
  const kiss_fftr_cfg inverse_config_;
};

// Appends to the N / 2 + 1 bins in `spectrum` the conjugates of bins
// N − N / 2 − 1 down to 1, giving the full Hermitian spectrum of N bins.
void AppendHermitianBins(size_t size, std::vector<std::complex<float>>* spectrum) {
  CHECK(size / 2 + 1 == spectrum->size());
  for (size_t k = size - size / 2 - 1; k >= 1; --k) spectrum->push_back(std::conj((*spectrum)[k]));
}

// A real transform through a complex one of the same size, for sizes that
// kissfft's real transform cannot take (odd) or takes slowly.
class ComplexBackendRealFFTTransformerImpl : public RealFFTTransformerImpl {
 public:
  explicit ComplexBackendRealFFTTransformerImpl(std::unique_ptr<ComplexFFTTransformerImpl> backend)
      : backend_(std::move(CHECK_NOTNULL(backend))) {
    const int size = backend_->GetSize();
    time_.resize(size);
    spectrum_.reserve(size);
  }

  int GetSize() const override { return backend_->GetSize(); }

  void Forward(const float* input, std::complex<float>* output) const override {
    const int size = GetSize();
    spectrum_.resize(size);
    for (int j = 0; j < size; ++j) time_[j] = input[j];
    backend_->Forward(time_.data(), spectrum_.data());
    for (int k = 0; k < size / 2 + 1; ++k) output[k] = spectrum_[k];
  }

  void Inverse(const std::complex<float>* input, float* output) const override {
    const int size = GetSize();
    // The capacity reserved at construction holds all N bins, so neither
    // assign nor the appended bins reallocate.
    spectrum_.assign(input, input + size / 2 + 1);
    AppendHermitianBins(size, &spectrum_);
    backend_->Inverse(spectrum_.data(), time_.data());
    for (int j = 0; j < size; ++j) output[j] = time_[j].real();
  }

 private:
  const std::unique_ptr<ComplexFFTTransformerImpl> backend_;
  // Scratch, N values each: separate buffers keep the backend out of place.
  mutable std::vector<std::complex<float>> time_;
  mutable std::vector<std::complex<float>> spectrum_;
};

std::unique_ptr<ComplexFFTTransformerImpl> MakeComplexImpl(int size) {
  if (IsFastFftSize(size)) return std::make_unique<KissComplexFFTTransformerImpl>(size);
  return std::make_unique<BluesteinComplexFFTTransformerImpl>(size);
}

std::unique_ptr<RealFFTTransformerImpl> MakeRealImpl(int size) {
  if (IsFastFftSize(size) && size % 2 == 0) {
    return std::make_unique<KissRealFFTTransformerImpl>(size);
  }
  return std::make_unique<ComplexBackendRealFFTTransformerImpl>(MakeComplexImpl(size));
}

void Scale(int size, std::complex<float>* values) {
  const float scale = 1.0f / size;
  for (int i = 0; i < size; ++i) values[i] *= scale;
}

void Scale(int size, float* values) {
  const float scale = 1.0f / size;
  for (int i = 0; i < size; ++i) values[i] *= scale;
}

}  // namespace

bool IsFastFftSize(int size) {
  if (size < 1) return false;
  while (size % 2 == 0) size /= 2;
  while (size % 3 == 0) size /= 3;
  while (size % 5 == 0) size /= 5;
  return size < 26;
}

ComplexFFTTransformer::ComplexFFTTransformer(int size, bool scale_inverse)
    : scale_inverse_(scale_inverse) {
  CHECK(size > 0);
  impl_ = MakeComplexImpl(size);
}

ComplexFFTTransformer::~ComplexFFTTransformer() = default;
ComplexFFTTransformer::ComplexFFTTransformer(ComplexFFTTransformer&&) noexcept = default;
ComplexFFTTransformer& ComplexFFTTransformer::operator=(ComplexFFTTransformer&&) noexcept = default;

int ComplexFFTTransformer::GetSize() const { return impl_->GetSize(); }

void ComplexFFTTransformer::Forward(const std::vector<std::complex<float>>& input,
                                    std::vector<std::complex<float>>* output) const {
  CHECK(input.size() == GetSize());
  CHECK(output);
  output->resize(GetSize());
  impl_->Forward(input.data(), output->data());
}

void ComplexFFTTransformer::Inverse(const std::vector<std::complex<float>>& input,
                                    std::vector<std::complex<float>>* output) const {
  CHECK(input.size() == GetSize());
  CHECK(output);
  output->resize(GetSize());
  Inverse(input.data(), output->data());
}

void ComplexFFTTransformer::Forward(const std::complex<float>* input,
                                    std::complex<float>* output) const {
  CHECK(input);
  CHECK(output);
  impl_->Forward(input, output);
}

void ComplexFFTTransformer::Inverse(const std::complex<float>* input,
                                    std::complex<float>* output) const {
  CHECK(input);
  CHECK(output);
  impl_->Inverse(input, output);
  if (scale_inverse_) Scale(GetSize(), output);
}

RealFFTTransformer::RealFFTTransformer(int size, bool scale_inverse)
    : scale_inverse_(scale_inverse) {
  CHECK(size > 0);
  impl_ = MakeRealImpl(size);
}

RealFFTTransformer::~RealFFTTransformer() = default;
RealFFTTransformer::RealFFTTransformer(RealFFTTransformer&&) noexcept = default;
RealFFTTransformer& RealFFTTransformer::operator=(RealFFTTransformer&&) noexcept = default;

int RealFFTTransformer::GetSize() const { return impl_->GetSize(); }

int RealFFTTransformer::GetTransformedSize() const { return GetSize() / 2 + 1; }

void RealFFTTransformer::Forward(const std::vector<float>& input,
                                 std::vector<std::complex<float>>* output) const {
  CHECK(input.size() == GetSize());
  CHECK(output);
  output->resize(GetTransformedSize());
  impl_->Forward(input.data(), output->data());
}

void RealFFTTransformer::Inverse(const std::vector<std::complex<float>>& input,
                                 std::vector<float>* output) const {
  CHECK(input.size() == GetTransformedSize());
  CHECK(output);
  output->resize(GetSize());
  Inverse(input.data(), output->data());
}

void RealFFTTransformer::Forward(const float* input, std::complex<float>* output) const {
  CHECK(input);
  CHECK(output);
  impl_->Forward(input, output);
}

void RealFFTTransformer::Inverse(const std::complex<float>* input, float* output) const {
  CHECK(input);
  CHECK(output);
  impl_->Inverse(input, output);
  if (scale_inverse_) Scale(GetSize(), output);
}

}  // namespace audio_dsp
