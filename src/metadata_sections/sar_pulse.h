// The transmitted pulse: a linear frequency-modulated chirp.
#pragma once

#include "raster/complex_sample.h"
#include "metadata_framework/general_sar_base.h"

class SARPulse_Obj : public GeneralSAR_Base {
 public:
  // Longest chirp generated, in samples (far beyond any real pulse: a 100 us
  // pulse sampled at 1 GHz has 100000).
  static constexpr int kMaxChirpSamples = 1 << 24;

  SARPulse_Obj();

  // Block "Pulse" of channel 1, or else the parameter-file section "Pulse".
  // Read: 0, or 1 when neither form holds all five values.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  int clone(SARPulse_Obj* other) const;

  // Samples of the chirp: PulseSamplingRate x PulseLength rounded half away
  // from zero; -1 when the pulse does not describe a chirp (length or
  // sampling rate not positive, bandwidth zero, values not finite, or more
  // than kMaxChirpSamples samples).
  int chirpSamples() const;
  // The chirp centred on the middle of the pulse, unit energy per sample
  // normalised by sqrt(|N fs / B|): sample n at t = (n - (N-1)/2) / fs is
  // exp(i pi B/T t^2) / sqrt(|N fs / B|).  `out` holds chirpSamples()
  // elements; the form with `capacity` refuses (1) a chirp longer than it.
  // 0, or 1 when the pulse does not describe a chirp.
  int generateChirp(fcomplex* out, int capacity) const;
  int generateChirp(fcomplex* out) const;
  // Writes the chirp as a raster of one line of FLOAT_COMPLEX samples named
  // `file`, with its header "<file>.hdr".  0, 1, or the code of the raster
  // writer.
  int writeChirp(const char* file) const;

  double PulseLength = -999;        // s
  double Bandwidth = -999;          // Hz
  double PulseKRate = -999;         // Hz/s
  double PulseEnergy = -999;        //
  double PulseSamplingRate = -999;  // Hz

 protected:
  void refreshParameters() override;
};
