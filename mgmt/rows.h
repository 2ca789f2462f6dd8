#pragma once
// Row layouts of the three tables, as the host's table framework reads them by column description: character columns
// are blank-padded and not terminated. Depends on nothing, so that the tasks can stand above it.

#include <cstddef>
#include <cstdint>

#pragma pack(push, 1)

struct vmq_kagreqt_data_t {
  char originnode[64];
  char transid[84];
  char command[16];
  char product[32];
  char context[3072];
  char optional[32];
  char daconfig[32];
  char dascript[512];
  int32_t retval;
  char version[12];
  char retmsgid[16];
  char retmsgparm[256];
  char targetmsn[64];
};

struct vmq_kagdyst_data_t {
  char originnode[64];
  char transid[84];
  char command[16];
  int32_t retval;
  char retmsgid[16];
  char retmsgparm[256];
  char targetmsn[64];
};

struct vmq_kinagt_data_t {
  char originnode[64];
  char corvelhome[512];
  char hosttype[5];
  char hostpc[10];
  char product[32];
  char version[12];
  char proddesc[80];
  char release[12];
  char platform[20];
};

#pragma pack(pop)

static_assert(sizeof(vmq_kagreqt_data_t) == 4196);
static_assert(offsetof(vmq_kagreqt_data_t, context) == 196);
static_assert(offsetof(vmq_kagreqt_data_t, retval) == 3844);
static_assert(offsetof(vmq_kagreqt_data_t, targetmsn) == 4132);
static_assert(sizeof(vmq_kagdyst_data_t) == 504);
static_assert(offsetof(vmq_kagdyst_data_t, retval) == 164);
static_assert(offsetof(vmq_kagdyst_data_t, targetmsn) == 440);
static_assert(sizeof(vmq_kinagt_data_t) == 747);
static_assert(offsetof(vmq_kinagt_data_t, hosttype) == 576);
static_assert(offsetof(vmq_kinagt_data_t, platform) == 727);
