// The XML auxiliary document of the metadata sections.
//
//   <TessalXmlDoc>
//     <NumberOfChannels>1</NumberOfChannels>
//     <Description>My description</Description>
//     <Channel Number="1">
//       <Section>
//         <Scalar>3</Scalar>
//         <Array><val N="1">1.5</val><val N="2">2.5</val></Array>
//         <Names N="1">a</Names><Names N="2">b</Names>
//       </Section>
//     </Channel>
//   </TessalXmlDoc>
//
// Field paths are relative to a channel and may hold several levels joined
// by '/'.  Writers create whatever is missing (document, channel, parents);
// readers return 1 when the field is absent.  Numbers are written with "%d"
// and "%.15g".  A numeric array is read from its `val` children or, when it
// has none, from the older list form "v1, v2, v3" in the element's text.
#pragma once

#include <libxml/tree.h>

#include <cstddef>
#include <string>

class tessalxml {
 public:
  tessalxml() = default;
  // Loads the file, or starts a new document when it is absent or not one
  // of ours.  A file held by a HeldXmlDocument of this thread gives the
  // held document instead, and write() leaves the saving to the holder.
  explicit tessalxml(const char* file);
  ~tessalxml();
  tessalxml(const tessalxml&) = delete;
  tessalxml& operator=(const tessalxml&) = delete;

  // Loads the file as above.  0 when an existing document was loaded, 1 when
  // a new one was started.
  int initXmlFile(const char* file);
  void setDebug(bool debug) { debug_ = debug; }
  // Sets the description text of the file's document and saves it.
  int setDescription(const char* file, const char* text);

  // Readers: 0, or 1 when the field (or one of its values) is absent or the
  // path is invalid.  Values read before a missing one are kept.
  int readInt(int channel, const char* path, int* values, int count);
  int readFloat(int channel, const char* path, float* values, int count);
  int readDouble(int channel, const char* path, double* values, int count);
  // One string into a buffer of `size` bytes; 1 also when it does not fit.
  int readString(int channel, const char* path, char* value, size_t size = 512);
  // `count` strings, each into a buffer of `size` bytes.
  int readString(int channel, const char* path, char** values, int count, size_t size = 512);

  // Writers: 0, or 1 when the path is not a valid element path.
  int writeInt(int channel, const char* path, const int* values, int count);
  int writeFloat(int channel, const char* path, const float* values, int count);
  int writeDouble(int channel, const char* path, const double* values, int count);
  int writeString(int channel, const char* path, const char* value);
  int writeString(int channel, const char* path, const char* const* values, int count);

  // Removes every element at `path` in the channel.  Returns 0.
  int removeElements(int channel, const char* path);

  // Saves the document formatted, in UTF-8, under its file name: 0, or 5
  // when the file cannot be written.
  int write();
  // Frees the document and forgets the file name.
  void clean();

  bool isLoaded() const { return doc_ != nullptr; }
  const std::string& fileName() const { return fileName_; }
  int numberOfChannels() const { return channels_; }

 private:
  void newDocument();
  bool recognised(xmlNodePtr root);
  int storedChannels() const;
  xmlNodePtr findChannel(int channel) const;
  xmlNodePtr channelForWrite(int channel);
  xmlNodePtr findField(int channel, const char* path) const;
  xmlNodePtr fieldForWrite(int channel, const char* path, xmlNodePtr* parent, std::string* leaf);
  template <class T>
  int readNumbers(int channel, const char* path, T* values, int count, const char* kind);
  template <class T>
  int writeNumbers(int channel, const char* path, const T* values, int count);
  void warnRead(const char* kind, const char* path, int channel) const;

  xmlDocPtr doc_ = nullptr;
  xmlNodePtr root_ = nullptr;
  std::string fileName_;
  int channels_ = 0;
  bool debug_ = false;
  bool borrowed_ = false;  // doc_ belongs to a HeldXmlDocument
};

// Holds the document of one file in memory while it lives: every section
// written to that file in this thread goes into it, and save() writes the
// file once, instead of a load and a save per section.  A hold that ends
// without save() leaves the file as it was.
class HeldXmlDocument {
 public:
  explicit HeldXmlDocument(const char* file);
  ~HeldXmlDocument();
  HeldXmlDocument(const HeldXmlDocument&) = delete;
  HeldXmlDocument& operator=(const HeldXmlDocument&) = delete;

  // Ends the hold and saves the document: 0, or 5 when the file cannot be
  // written.
  int save();

 private:
  friend class tessalxml;
  void release();

  tessalxml doc_;
  HeldXmlDocument* outer_ = nullptr;
  bool holding_ = false;
};
