// The kinds of ASAR Level-1 image products the extraction handles, and
// everything that differs between them, in one table: how many images a
// product holds, where its sensing times come from, how its images are
// named, which data set and polarisation each image takes, and the type
// codes of its data-set information.
#pragma once

#include <string>

#include "metadata_sections/data_set_info.h"

// How the data-set information names the swath of an image.
enum class SwathNaming {
  kSubSwath,  // "SS1".."SS5": wide-swath sub-swaths
  kSphSwath,  // the SPH swath ("IS2", "WS ", "GM ")
  kIsDigit,   // "IS" followed by the swath digit of the SPH swath
};

// How the chirp power of an image is found.
enum class ChirpPowerSource {
  kNone,             // stays at its default
  kRecordOfImage,    // float of chirp record k (wide-swath sub-swath k)
  kMatchingPolarDb,  // dB value of the first record with the image's polarisation
};

struct ProductKind {
  const char* type;         // characters 4 to 6 of the product name, "" for the rest
  const char* description;  // data-set description; nullptr: the SPH descriptor
  int images;               // fixed number of images; 0: one per main-parameters record
  bool wideSwath;           // bursts, sub-swaths, per-sub-swath annotation
  bool sensingFromMph;      // sensing start and stop from the MPH, else the SPH line times
  bool linesSummed;         // output lines summed over all main-parameters records
  SwathNaming swath;
  ChirpPowerSource chirpPower;
  bool secondNoiseField;  // the second image's noise power lies at its own field
  int droopMode;          // entry of the instrument characterisation file
  DSAcqMode mode;
  DSUnitType unit;
  DSImageType image;
  DSProjection projection;
};

// The kind of a product type ("WSS", "APS", ...); any type not in the table
// is a single-image product ("IMS", ...).
const ProductKind& FindProductKind(const std::string& type);
