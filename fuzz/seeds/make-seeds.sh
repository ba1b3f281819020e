#!/usr/bin/env bash
# Recreates the fuzz targets' seed corpora under fuzz/seeds/<target>/ from the standard tools
# (qemu-img, sfdisk, sgdisk, mkfs.*) and brindle-cli for the own-format image. The seeds are
# committed, so the fuzz runs need none of these tools.
#   BRINDLE_CLI   brindle-cli to make the own-format seeds (default: build/asan/cli/brindle-cli)
set -euo pipefail
cd "$(dirname "$0")"
out=$PWD
cli=${BRINDLE_CLI:-$out/../../build/asan/cli/brindle-cli}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"

# Writes a seed: a prefix given as hex bytes (may be empty) followed by the named files' bytes.
seed() {
  local target=$1 name=$2 prefix=$3
  shift 3
  mkdir -p "$out/$target"
  { printf '%s' "$prefix" | xxd -r -p; cat "$@"; } >"$out/$target/$name"
}
# Bytes [offset, offset+length) of a file into a new file.
cut_bytes() { dd if="$1" of="$2" bs=512 iflag=skip_bytes,count_bytes skip="$3" count="$4" status=none; }
be64() { printf '%016x' "$1"; }

rm -rf "$out"/fuzz_*/

# Images. A seed of the image targets starts with one byte whose low bit asks the harness to
# repair the checksums after mutation.
qemu-img create -q -f vpc -o subformat=dynamic dyn.vhd 1M
qemu-img create -q -f vpc -o subformat=fixed,force_size=on fixed.vhd 8K
qemu-img create -q -f vmdk sparse.vmdk 1M
{ yes "brindle fuzz seed" || true; } | head -c 16384 >raw16k
printf 'BRINDLE FUZZ SEED' | dd of=raw16k conv=notrunc status=none
qemu-img create -q -f vmdk -o subformat=twoGbMaxExtentSparse split.vmdk 1M
seed fuzz_image_vhd dynamic.vhd 01 dyn.vhd
seed fuzz_image_vhd fixed.vhd 01 fixed.vhd
seed fuzz_image_vhd dynamic-checked.vhd 00 dyn.vhd
seed fuzz_image_vmdk sparse.vmdk '' sparse.vmdk
seed fuzz_image_vmdk descriptor.vmdk '' split.vmdk

# Own-format images: 8 sectors in one-sector blocks (one group of 64 blocks), 80 sectors in
# one-sector blocks (two groups) and 32 sectors in 8-sector blocks.
if [ -x "$cli" ]; then
  head -c 4096 raw16k >raw4k
  head -c 40960 /dev/zero >raw40k
  dd if=raw16k of=raw40k conv=notrunc bs=512 seek=70 count=10 status=none
  "$cli" image create raw4k small.tdi --sectors-per-block 1 >/dev/null 2>&1
  "$cli" image create raw40k groups.tdi --sectors-per-block 1 --level 1 >/dev/null 2>&1
  "$cli" image create raw16k blocks.tdi --sectors-per-block 8 --description seed >/dev/null 2>&1
  for f in small groups blocks; do seed fuzz_image_tarvo "$f.tdi" 01 "$f.tdi"; done
  seed fuzz_image_tarvo small-checked.tdi 00 small.tdi
  seed fuzz_image_detect own.tdi '' small.tdi
else
  echo "no brindle-cli at $cli: own-format seeds skipped" >&2
fi
seed fuzz_image_detect dynamic.vhd '' dyn.vhd
seed fuzz_image_detect fixed.vhd '' fixed.vhd
seed fuzz_image_detect sparse.vmdk '' sparse.vmdk

# Partition tables. fuzz_partitions: sector count (8 bytes, big-endian), a flags byte (bit 0:
# 4096-byte sectors, bit 1: repair the GPT checksums), the head/tail split (x/255 of the rest),
# then the device's first and last bytes.
truncate -s 32K mbr.img
printf 'label: dos\nstart=2, size=8, type=83\nstart=10, size=50, type=5\nstart=12, size=8, type=83\nstart=22, size=8, type=7\nstart=32, size=20, type=c\n' |
  sfdisk -q mbr.img
truncate -s 1M gpt.img
sgdisk --resize-table=4 -n 1:34:+8 -t 1:8300 -c 1:root -n 2:0:+16 -t 2:0700 -c 2:data gpt.img >/dev/null
truncate -s 1M hybrid.img
sgdisk --resize-table=4 -n 1:34:+8 -t 1:ef00 -n 2:0:+16 -t 2:0700 -h 1:2 hybrid.img >/dev/null
cut_bytes mbr.img mbr-head 0 16384
cut_bytes gpt.img gpt-head 0 1536
cut_bytes gpt.img gpt-tail $((1048576 - 1024)) 1024
cut_bytes hybrid.img hybrid-head 0 1536
cut_bytes hybrid.img hybrid-tail $((1048576 - 1024)) 1024
# split byte 153: 2560 * 153 / 255 = 1536 bytes of head.
seed fuzz_partitions mbr-extended "$(be64 64)00ff" mbr-head
seed fuzz_partitions gpt "$(be64 2048)0299" gpt-head gpt-tail
seed fuzz_partitions gpt-checked "$(be64 2048)0099" gpt-head gpt-tail
seed fuzz_partitions gpt-hybrid "$(be64 2048)0299" hybrid-head hybrid-tail

# Templates: byte 0 picks the sector size (bits 0-2, 0 = 512), the kind (bits 3-6, index in id
# order: 0 MBR, 1-5 LDM, 6 GPT) and the rendering as text and JSON (bit 7), byte 1 the source
# size above the data in 4 KiB, bytes 2-3 the record offset.
seed fuzz_templates mbr 00000000 mbr-head
seed fuzz_templates mbr-rendered 80000000 mbr-head
seed fuzz_templates gpt 30000200 gpt-head
seed fuzz_templates gpt-rendered b0000200 gpt-head

# File systems: boot blocks and the structures near them.
truncate -s 1M fat12.img && mkfs.fat -F 12 -n SEED -i 1234ABCD fat12.img >/dev/null
truncate -s 16M fat16.img && mkfs.fat -F 16 -n SEED -i 1234ABCD fat16.img >/dev/null
truncate -s 4M exfat.img && mkfs.exfat -L SEED exfat.img >/dev/null 2>&1
truncate -s 2M ntfs.img && mkfs.ntfs -F -Q -q -L SEED ntfs.img >/dev/null 2>&1
truncate -s 1M ext2.img && mke2fs -q -F -t ext2 -b 1024 -N 16 ext2.img
truncate -s 16M btrfs.img && mkfs.btrfs -q -f --mixed btrfs.img >/dev/null 2>&1
truncate -s 16M xfs.img && TEST_DIR=1 TEST_DEV=1 QA_CHECK_FS=1 mkfs.xfs -q -f xfs.img >/dev/null 2>&1 || true
# fuzz_detect_volume: byte 0 is the sector size and flags (0: 512-byte fixed media).
cut_bytes fat12.img fat12-head 0 16384
cut_bytes fat16.img fat16-head 0 32768
cut_bytes exfat.img exfat-head 0 32768
cut_bytes ntfs.img ntfs-head 0 16384
cut_bytes ext2.img ext2-head 0 16384
cut_bytes btrfs.img btrfs-head 0 69632
[ -s xfs.img ] && cut_bytes xfs.img xfs-head 0 4096
for fs in fat12 fat16 exfat ntfs ext2 btrfs xfs; do
  [ -s $fs-head ] && seed fuzz_detect_volume $fs 00 $fs-head
done
# fuzz_storage_layout: the kind, the volume size (8 bytes, big-endian), then the volume's bytes.
# The boot sector or superblock and the few sectors after it are what the layout reads.
for fs in fat12:07:1048576 fat16:07:16777216 exfat:09:4194304 ntfs:0a:2097152 ext2:0e:1048576; do
  IFS=: read -r name kind size <<<"$fs"
  head -c 8192 $name-head >$name-8k
  seed fuzz_storage_layout $name "$kind$(be64 "$size")" $name-8k
done
seed fuzz_storage_layout btrfs 14"$(be64 16777216)" btrfs-head
# fuzz_device_volumes: whole small disks.
truncate -s 64K disk.img
printf 'label: dos\nstart=2, size=120, type=1\nstart=122, size=6, type=5\nstart=124, size=4, type=83\n' |
  sfdisk -q disk.img
truncate -s 60K part.img && mkfs.fat -F 12 -n SEED part.img >/dev/null
dd if=part.img of=disk.img bs=512 seek=2 conv=notrunc status=none
truncate -s 40K gdisk.img
sgdisk --resize-table=4 -n 1:8:+48 -t 1:0700 gdisk.img >/dev/null
dd if=fat12-head of=gdisk.img bs=512 seek=8 count=48 conv=notrunc status=none
seed fuzz_device_volumes mbr-fat '' disk.img
seed fuzz_device_volumes gpt-fat '' gdisk.img
seed fuzz_device_volumes dynamic.vhd '' dyn.vhd

# Identify data: hand-made blocks (a 48-bit drive with model, serial and firmware, and a
# configuration overlay block), each with the signature and checksum in word 255.
python3 - "$out" <<'EOF'
import os, struct, sys
out = sys.argv[1]
def text(s, n):
    s = s.ljust(n)[:n].encode()
    return b''.join(bytes((s[i + 1], s[i])) for i in range(0, n, 2))
def signed(w):
    b = bytearray(struct.pack('<256H', *w))
    b[510] = 0xA5
    b[511] = (-sum(b[:511])) & 0xFF
    return bytes(b)
w = [0] * 256
w[0] = 0x0040
w[10:20] = struct.unpack('<10H', text('SEED0001', 20))
w[23:27] = struct.unpack('<4H', text('1.0', 8))
w[27:47] = struct.unpack('<20H', text('BRINDLE SEED DISK', 40))
w[49] = 0x0300
w[60], w[61] = 0xFFFF, 0x0FFF
w[83] = 1 << 10 | 1 << 14
w[86] = 1 << 10
w[100:104] = (0x5000, 0x0950, 1, 0)
identify48 = signed(w)
w28 = list(w); w28[83] = 1 << 14; w28[86] = 0; w28[100:104] = (0, 0, 0, 0); w28[60], w28[61] = 0x2000, 0x0010
identify28 = signed(w28)
d = [0] * 256
d[0] = 2
d[3:7] = (0xFFFF, 0xFFFF, 0x0FFF, 0)
dco = signed(d)
def put(target, name, data):
    os.makedirs(os.path.join(out, target), exist_ok=True)
    with open(os.path.join(out, target, name), 'wb') as f:
        f.write(data)
put('fuzz_ata_identify', 'identify48', identify48)
put('fuzz_ata_identify', 'identify28', identify28)
put('fuzz_ata_identify', 'dco', dco)
put('fuzz_root_identity', 'identify48', identify48)
put('fuzz_ata_string', 'model', bytes((27, 20)) + identify48)
put('fuzz_ata_string', 'serial', bytes((10, 10)) + identify48)
put('fuzz_root_identity', 'mountinfo',
    b'22 1 8:1 / / rw,relatime shared:1 - ext4 /dev/sda1 rw\n'
    b'23 22 0:21 / /proc rw,nosuid - proc proc rw\n'
    b'30 22 8:17 / /mnt/with\\040space rw - vfat /dev/sdb1 rw,fmask=0022\n')
put('fuzz_native_path', 'absolute', b'/dev/sda')
put('fuzz_native_path', 'relative', b'images/disk one.vhd')
put('fuzz_native_path', 'unc', b'//server/share/dir/file')
EOF
echo "seeds in $out: $(find "$out" -type f -path '*/fuzz_*' | wc -l) files, $(du -sk --exclude=make-seeds.sh "$out" | cut -f1) KiB"
