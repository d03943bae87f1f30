"""Provisions an Active Directory domain controller: realm CORP.EXAMPLE.NET, NetBIOS name ACME.

    /usr/bin/python3 provision.py FOLDER

All its files, including smb.conf, are in FOLDER. The directory trusts a second domain, LAB.EXAMPLE.NET, with the
NetBIOS name LABOR. Only the trust entry exists, as administrators would add it; no controller of that domain runs.
"""
import logging
import os
import random
import string
import sys
import uuid

from samba.auth import system_session
from samba.dcerpc import drsblobs, lsa, security
from samba.dsdb import DS_DOMAIN_FUNCTION_2008_R2
from samba.ndr import ndr_pack
from samba.param import LoadParm
from samba.provision import FILL_FULL, provision

REALM = 'CORP.EXAMPLE.NET'
NETBIOS_NAME = 'ACME'
TRUSTED = 'lab.example.net'
TRUSTED_NETBIOS_NAME = 'LABOR'

SETTINGS = f"""
[global]
    netbios name = DC1
    realm = {REALM}
    workgroup = {NETBIOS_NAME}
    server role = active directory domain controller
    # winbindd is started separately, so that a test can end it. No file services.
    server services = rpc, ldap, cldap, kdc
    rpc start on demand helpers = no
    interfaces = lo
    bind interfaces only = yes
    private dir = {{folder}}/private
    state directory = {{folder}}/state
    cache directory = {{folder}}/cache
    lock directory = {{folder}}/lock
    pid directory = {{folder}}/pid
    binddns dir = {{folder}}/dns
    logging = file
    log file = {{folder}}/log.%m
    tls enabled = no

[sysvol]
    path = {{folder}}/sysvol

[netlogon]
    path = {{folder}}/sysvol/scripts
"""


def trust(database):
    """Adds the trusted domain."""
    secret = ndr_pack(make_secret())
    name = TRUSTED
    database.add({
        'dn': f'CN={name},CN=System,{database.domain_dn()}',
        'objectClass': 'trustedDomain',
        'trustPartner': name,
        'flatName': TRUSTED_NETBIOS_NAME,
        'trustDirection': str(lsa.LSA_TRUST_DIRECTION_OUTBOUND),
        'trustType': str(lsa.LSA_TRUST_TYPE_UPLEVEL),
        'trustAttributes': str(lsa.LSA_TRUST_ATTRIBUTE_FOREST_TRANSITIVE),
        'securityIdentifier': ndr_pack(security.dom_sid('S-1-5-21-1111111111-2222222222-3333333333')),
        'trustAuthOutgoing': secret,
    })


def make_secret():
    """Returns a random trust secret."""
    password = ''.join(random.SystemRandom().choices(string.ascii_letters, k=24)).encode('utf-16-le')
    clear = drsblobs.AuthInfoClear()
    clear.size = len(password)
    clear.password = list(password)
    information = drsblobs.AuthenticationInformation()
    information.LastUpdateTime = 0
    information.AuthType = lsa.TRUST_AUTH_TYPE_CLEAR
    information.AuthInfo = clear
    both = drsblobs.AuthenticationInformationArray()
    both.count = 1
    both.array = [information]
    blob = drsblobs.trustAuthInOutBlob()
    blob.count = 1
    blob.current = both
    return blob


def main():
    """Provisions."""
    folder = sys.argv[1]
    file = os.path.join(folder, 'smb.conf')
    with open(file, 'w', encoding='utf-8') as smb_conf:
        smb_conf.write(SETTINGS.format(folder=folder))
    for name in ('private', 'state', 'cache', 'lock', 'pid', 'dns', 'sysvol', 'sysvol/scripts'):
        os.mkdir(os.path.join(folder, name))
    settings = LoadParm()
    settings.load(file)
    result = provision(
        logger=logging.getLogger(), session_info=system_session(settings), smbconf=file, targetdir=None,
        samdb_fill=FILL_FULL, realm=REALM, domain=NETBIOS_NAME, hostname='DC1', hostip='127.0.0.1', hostip6=None,
        adminpass='Aa1-' + uuid.uuid4().hex, serverrole='active directory domain controller',
        dns_backend='NONE',
        dom_for_fun_level=DS_DOMAIN_FUNCTION_2008_R2, lp=settings, use_ntvfs=False, skip_sysvolacl=True, batch_mode=True)
    trust(result.samdb)


if __name__ == '__main__':
    main()
