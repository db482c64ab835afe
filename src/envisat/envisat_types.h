// Recognition of ENVISAT product types by the product name of the main
// product header, and the validity test of a DORIS orbit file for a product.
#pragma once

// Numbers that find_type returns, in the order the codes are tried.
enum EnvisatTypeNumber {
  kEnvisatUnknown = 0,
  kEnvisatAsaAps = 1,
  kEnvisatAsaApp = 2,
  kEnvisatAsaApm = 3,
  kEnvisatAsaApc = 4,
  kEnvisatAsaAph = 5,
  kEnvisatAsaApv = 6,
  kEnvisatAsaIms = 7,
  kEnvisatAsaIm0 = 8,
  kEnvisatAsaWss = 9,
  kEnvisatAsaWsm = 10,
  kEnvisatAsaWs0 = 11,
  kEnvisatDorVor = 12,
  kEnvisatDorPor = 13,
  kEnvisatAsaXca = 14,
  kEnvisatAsaXch = 15,
  kEnvisatAsaIns = 16,
};

// Stateless: every operation takes the path of the file to look at.  The
// is_ tests give 1 when the product name (main product header offset 9)
// begins with their code, compared case-sensitively, else 0; a file that
// cannot be opened or is too short gives 0.
class EnvisatTypes {
 public:
  static int is_aps(const char* path);
  static int is_app(const char* path);
  static int is_apm(const char* path);
  static int is_apc(const char* path);
  static int is_aph(const char* path);
  static int is_apv(const char* path);
  static int is_ims(const char* path);
  static int is_im0(const char* path);
  static int is_wss(const char* path);
  static int is_wsm(const char* path);
  static int is_ws0(const char* path);
  static int is_dorvor(const char* path);
  static int is_dorpor(const char* path);
  static int is_xca(const char* path);
  static int is_xch(const char* path);
  static int is_ins(const char* path);

  // Number of the first code that matches (EnvisatTypeNumber), else 0.
  static int find_type(const char* path);

  // 1 when the orbit file's validity (its sensing start and stop) strictly
  // contains the sensing start of the ASAR product (find_type 1 to 11), else
  // 0, also when either file cannot be opened or read, and when one of the
  // three times is not a date (reported as an error naming it).
  static int check_dorvor(const char* product_path, const char* orbit_path);
};
